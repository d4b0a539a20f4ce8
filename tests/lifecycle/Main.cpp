#include <gmock/gmock.h>

#include <chrono>
#include <cstdlib>
#include <iostream>
#include <optional>

#include "Runner.h"

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

int runRange(const Lifecycle::Range& range) {
    const auto start = std::chrono::steady_clock::now();
    const std::string found = Lifecycle::run(range);
    const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
    if (!found.empty()) {
        std::cout << found;
        return 1;
    }
    std::cout << range.count << " sequences from seed " << range.first << " on: all well, "
              << time.count() << " s\n";
    return 0;
}

}  // namespace

/** Without arguments of its own this is a test program like the others. */
int main(int argc, char** argv) {
    ::testing::InitGoogleMock(&argc, argv);
    if (argc == 1) {
        return RUN_ALL_TESTS();
    }
    if (const std::optional<Lifecycle::Range> range = readArguments(argc, argv)) {
        return runRange(*range);
    }
    std::cerr << "usage: tests_lifecycle [--seed S] [--sequences N]\n";
    return 2;
}
