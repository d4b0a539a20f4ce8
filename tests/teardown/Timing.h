/**
 * @file
 * How long something took, time and again.
 */
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

namespace TearDown {

/**
 * The promise is 50 ms. A single measurement on a machine that is busy with something else tells
 * more of its scheduler than of us, so the median keeps the promise; and no single one may come
 * near what a wait for a time-out would take (the shortest that there is is a second).
 */
constexpr double MEDIAN_MS_MAX = 50;
constexpr double SINGLE_MS_MAX = 1000;

/**
 * The end of a whole process is measured from outside, and includes what the sanitizers do then:
 * they give back terabytes of address space and look through their tables.
 */
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr double PROCESS_FACTOR = 4;
#else
constexpr double PROCESS_FACTOR = 1;
#endif

class Timing {
  public:
    explicit Timing(std::string what) : name(std::move(what)) {}

    void add(double ms) { values.push_back(ms); }

    /** Prints the figures, as a row of a table, and checks them. */
    void expectBounded(double factor = 1) {
        ASSERT_FALSE(values.empty()) << name;
        std::sort(values.begin(), values.end());
        const double median = values[values.size() / 2];
        std::printf("| %s | %zu | %.1f | %.1f |\n", name.c_str(), values.size(), median,
                    values.back());
        EXPECT_LE(median, MEDIAN_MS_MAX * factor) << name;
        EXPECT_LE(values.back(), SINGLE_MS_MAX) << name;
    }

  private:
    const std::string name;
    std::vector<double> values;
};

}  // namespace TearDown
