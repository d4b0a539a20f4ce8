#include "Application.h"

#include <chrono>
#include <cstdlib>
#include <sstream>

namespace TearDown {

namespace {

std::string addOptions(const char* variable, const std::string& more) {
    const char* const options = std::getenv(variable);
    return (options != nullptr ? std::string(options) + ":" : "") + more;
}

/**
 * What the sanitizers do at the end of a process takes its time, which is none of ours: one
 * searches for leaks, the other sleeps for a second in the hope of a race. That threads of the
 * application's own server still run then is no fault.
 */
TestSupport::ChildProcess::Environment makeEnvironment(bool searches) {
    return {
        {"ASAN_OPTIONS",
         addOptions("ASAN_OPTIONS", searches ? "detect_leaks=1" : "detect_leaks=0")},
        {"TSAN_OPTIONS", addOptions("TSAN_OPTIONS", std::string("report_thread_leaks=0") +
                                                        (searches ? "" : ":atexit_sleep_ms=0"))}};
}

/** The clock on which the application tells when its end began. */
double nowMs() {
    return std::chrono::duration<double, std::milli>(
               std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

}  // namespace

Application::Application(const Words& command, Leaks leaks)
    : process(command, makeEnvironment(leaks == Leaks::SEARCHED)) {}

Words Application::makeCommand(const Words& words) {
    Words command = {TEARDOWN_APP};
    command.insert(command.end(), words.begin(), words.end());
    return command;
}

bool Application::readMore() {
    const std::string piece = process.read();
    output += piece;
    return !piece.empty();
}

bool Application::waitUntilReady() {
    while (output.find("ready\n") == std::string::npos) {
        if (!readMore()) {
            return false;
        }
    }
    return true;
}

void Application::finish(Timing& timing) {
    while (readMore()) {
    }
    const int status = process.wait();
    const double endedMs = nowMs();
    EXPECT_EQ(status, 0) << output;
    EXPECT_EQ(output.find("too late"), std::string::npos) << output;
    std::istringstream lines(output);
    std::string word;
    while (lines >> word) {
        double value = 0;
        if (word == "took" && lines >> value) {
            timing.add(value);
        } else if (word == "ends" && lines >> value) {
            timing.add(endedMs - value / 1e6);
        }
    }
}

}  // namespace TearDown
