/**
 * @file
 * Finds the checks of invariants in the sources.
 */
#pragma once

#include <filesystem>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

namespace DocsTest {

/** One place that may report an assertion, as the report names it. */
struct AssertionSite {
    std::string condition;
    std::string path;
    std::string line; /**< empty where it moves with the code */

    bool operator<(const AssertionSite& other) const {
        return std::tie(path, line, condition) < std::tie(other.path, other.line, other.condition);
    }
    bool operator==(const AssertionSite& other) const {
        return std::tie(path, line, condition) == std::tie(other.path, other.line, other.condition);
    }
};

inline void PrintTo(const AssertionSite& site, std::ostream* out) {
    *out << site.condition << " (" << site.path << ":" << site.line << ")";
}

/**
 * All sites below the shipped folders of a project, sorted. A place that was given its text by its
 * callers counts once for each call. A place that the scanner cannot read has the condition
 * "UNREADABLE" and its source file.
 */
std::vector<AssertionSite> findAssertionSites(const std::filesystem::path& project);

/** The names of all tests, "Suite.Name" of C++ and "Class.method" of Java. */
std::vector<std::string> findTests(const std::filesystem::path& project);

}  // namespace DocsTest
