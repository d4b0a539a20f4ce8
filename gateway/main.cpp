#include <CLI/CLI.hpp>
#include <csignal>
#include <cstdio>
#include <exception>
#include <string>

#include "gateway/Server.h"
#include "pal/kd_log.h"
#include "tools/AssertionHandler.h"

namespace {

constexpr const char* DESCRIPTION =
    "Development gateway: recognises what the speech kit sends, with a small English model.\n"
    "A tool for developers, made for the loopback interface: it has no encryption, no\n"
    "authentication and no defence against overload. Do not offer it to a network.";

constexpr const char* VERSION = "talvox-gateway " TALVOX_VERSION " (" TALVOX_BUILD_ID ")";

const CLI::Validator IS_NOT_EMPTY(
    [](const std::string& text) { return std::string(text.empty() ? "the value is empty" : ""); },
    "");

constexpr unsigned MAX_BODY_BYTES_LIMIT = 1U << 30U;

/** Decimal digits only: CLI11 would read 010 as 8. */
CLI::Validator wholeNumber(unsigned min, unsigned max) {
    const auto check = [min, max](const std::string& text) {
        const bool isDecimal = !text.empty() && text.size() <= 10 &&
                               text.find_first_not_of("0123456789") == std::string::npos &&
                               (text.size() == 1 || text[0] != '0');
        const unsigned long long value = isDecimal ? std::stoull(text) : 0;
        return isDecimal && value >= min && value <= max
                   ? std::string()
                   : "\"" + text + "\" is not a whole number from " + std::to_string(min) + " to " +
                         std::to_string(max);
    };
    return {check, "from " + std::to_string(min) + " to " + std::to_string(max)};
}

void declareOptions(CLI::App& app, Gateway::ServerOptions& options) {
    app.set_version_flag("--version", VERSION);
    app.add_option("--host", options.host, "Address to listen on")->capture_default_str();
    app.add_option("--port", options.port, "Port to listen on; 0 picks a free one")
        ->check(wholeNumber(0, 65535))
        ->capture_default_str();
    app.add_option("--model-dir", options.model.acousticDir, "Folder of the acoustic model")
        ->capture_default_str();
    app.add_option("--lm", options.model.languageModel, "Language model")->capture_default_str();
    app.add_option("--dict", options.model.dictionary, "Pronouncing dictionary")
        ->capture_default_str();
    app.add_option("--lang", options.model.language,
                   "Language of the model, such as en or en-US; requests in others get status 400")
        ->check(IS_NOT_EMPTY)
        ->capture_default_str();
    app.add_option("--decoders", options.decoders,
                   "Requests recognised at once (about 100 MB each); others wait")
        ->check(wholeNumber(1, 64))
        ->capture_default_str();
    app.add_option("--decoder-wait", options.decoderWaitMs,
                   "Milliseconds that a request waits, once it is complete, for a free decoder; "
                   "then it gets status 503")
        ->check(wholeNumber(0, 60000))
        ->capture_default_str();
    app.add_option("--max-body", options.maxBodyBytes,
                   "Longest request body in bytes; longer ones get status 413")
        ->check(wholeNumber(1, MAX_BODY_BYTES_LIMIT))
        ->capture_default_str();
    app.add_option("--log-file", options.recordFile,
                   "File to which the usage records that clients send to /log are appended, one "
                   "line each [standard output]");
    app.add_flag("--page", options.hasPage,
                 "Show the last sessions on a page at /, as they run; needs a loopback address");
    app.add_flag("--verbose", options.verbose, "Log each piece of a request as it arrives");
}

/** Blocks the signals that end the process, for this thread and those that it starts. */
sigset_t blockEndSignals() {
    std::signal(SIGPIPE, SIG_IGN);
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    return signals;
}

int run(const Gateway::ServerOptions& options) {
    const sigset_t signals = blockEndSignals();
    Gateway::Server server(options);
    const std::string problem = server.start();
    if (!problem.empty()) {
        std::fprintf(stderr, "talvox-gateway: %s\n", problem.c_str());
        return 1;
    }
    kdLogFormatMessage("development gateway, for the loopback interface only");
    if (!server.isOnLoopback()) {
        kdLogFormatMessage(
            "WARNING: %s is not a loopback address; anybody who reaches it can use "
            "this gateway",
            options.host.c_str());
    }
    if (options.hasPage) {
        kdLogFormatMessage("the last sessions are shown at %s/", server.getUrl().c_str());
    }
    std::printf("talvox-gateway listening on %s\n", server.getUrl().c_str());
    std::fflush(stdout);
    int signal = 0;
    sigwait(&signals, &signal);
    kdLogFormatMessage("stopping");
    server.stop();
    return 0;
}

int parseAndRun(int argc, char** argv) {
    CLI::App app(DESCRIPTION, "talvox-gateway");
    Gateway::ServerOptions options;
    declareOptions(app, options);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() == 0) {
            return app.exit(error);
        }
        std::fprintf(stderr, "talvox-gateway: %s\n", error.what());
        return 2;
    }
    return run(options);
}

}  // namespace

int main(int argc, char** argv) {
    Tools::installAssertionHandler("talvox-gateway");
    try {
        return parseAndRun(argc, argv);
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "talvox-gateway: %s\n", failure.what());
        return 1;
    }
}
