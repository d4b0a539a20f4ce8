#include <gmock/gmock.h>

#include <chrono>
#include <cstdlib>
#include <iostream>
#include <optional>

#include "Runner.h"
#include "Testbed.h"
#include "support/AbortOnAssertion.h"

namespace {

/** "--seed S" and "--sequences N". @return none when the arguments are something else */
std::optional<Lifecycle::Range> readArguments(int argc, char** argv) {
    Lifecycle::Range range{1, 1};
    for (int i = 1; i < argc; i += 2) {
        const std::string name = argv[i];
        if ((name != "--seed" && name != "--sequences") || i + 1 == argc) {
            return std::nullopt;
        }
        (name == "--seed" ? range.first : range.count) = std::strtoull(argv[i + 1], nullptr, 10);
    }
    return range;
}

const std::string& nameOfEnd(std::size_t code) {
    static const std::string RESULTS = "results";
    return code < Talvox::SpeechError::ErrorMax ? Talvox::SpeechError::errorStrings[code] : RESULTS;
}

int runRange(const Lifecycle::Range& range) {
    const auto start = std::chrono::steady_clock::now();
    Lifecycle::Testbed testbed;
    const std::string found = Lifecycle::run(testbed, range);
    const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
    if (!found.empty()) {
        std::cout << found;
        return 1;
    }
    std::cout << range.count << " sequences from seed " << range.first << " on: all well, "
              << time.count() << " s\n";
    for (std::size_t code = 0; code < testbed.getEnds().size(); ++code) {
        std::cout << "  " << nameOfEnd(code) << ": " << testbed.getEnds()[code] << "\n";
    }
    std::cout << "calls in microseconds: half of them, 999 of 1000, the longest\n";
    for (const auto& [action, times] : testbed.getCallTimes()) {
        std::cout << "  " << nameOf(action) << ": " << times.quantile(500) << ", "
                  << times.quantile(999) << ", " << times.quantile(1000) << " (" << times.count()
                  << " calls)\n";
    }
    return 0;
}

}  // namespace

/** Without arguments of its own this is a test program like the others. */
int main(int argc, char** argv) {
    ::testing::InitGoogleMock(&argc, argv);
    TestSupport::abortOnAssertion();
    if (argc == 1) {
        return RUN_ALL_TESTS();
    }
    if (const std::optional<Lifecycle::Range> range = readArguments(argc, argv)) {
        return runRange(*range);
    }
    std::cerr << "usage: tests_lifecycle [--seed S] [--sequences N]\n";
    return 2;
}
