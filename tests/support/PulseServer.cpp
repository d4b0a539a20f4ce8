#include "support/PulseServer.h"

#include <signal.h>
#include <sys/stat.h>

#include <cstdlib>
#include <fstream>

#include "support/Threads.h"

// The client library keeps objects of all its connections in lock-free lists. It is not
// instrumented, so ThreadSanitizer does not see what orders the threads that pass such an object
// on. Frames of the library stand in a report only where the library itself calls a function of the
// C library.
// NOLINTBEGIN(bugprone-reserved-identifier): the name that the sanitizer looks for.
extern "C" __attribute__((visibility("default"))) const char* __tsan_default_suppressions();

extern "C" const char* __tsan_default_suppressions() {
    return "race:libpulsecommon";
}
// NOLINTEND(bugprone-reserved-identifier)

namespace TestSupport {

namespace {

const char READY_LINE[] = "Daemon startup complete.";
const char SOURCE_NAME[] = "mic";

std::string addressIn(const ScratchDirectory& directory) {
    return "unix:" + directory.path("pulse.sock");
}

}  // namespace

PulseEnvironment::PulseEnvironment(const ScratchDirectory& home, const std::string& serverAddress) {
    mkdir(home.path("run").c_str(), 0700);
    variables = {{"HOME", home.path("")},
                 {"XDG_RUNTIME_DIR", home.path("run")},
                 {"PULSE_SERVER", serverAddress}};
    for (const auto& variable : variables) {
        const char* value = std::getenv(variable.first.c_str());
        before.emplace_back(variable.first, value != nullptr ? std::make_unique<std::string>(value)
                                                             : std::unique_ptr<std::string>());
        setenv(variable.first.c_str(), variable.second.c_str(), 1);
    }
}

PulseEnvironment::~PulseEnvironment() {
    // Those that are over soon still read the environment.
    waitForThreads([] { return countThreads("talvox-audio") == 0; });
    for (const auto& variable : before) {
        if (variable.second) {
            setenv(variable.first.c_str(), variable.second->c_str(), 1);
        } else {
            unsetenv(variable.first.c_str());
        }
    }
}

PulseServer::PulseServer() : environment(directory, addressIn(directory)) {
    for (const char* program : {"pulseaudio", "pactl", "paplay"}) {
        if (!ChildProcess::isInstalled(program)) {
            output = std::string(program) + " is not installed";
            return;
        }
    }
    process = std::make_unique<ChildProcess>(
        std::vector<std::string>{
            "pulseaudio", "-n", "--daemonize=no", "--use-pid-file=no", "--exit-idle-time=60",
            "--realtime=no", "--log-target=stderr", "--log-level=info", "-L",
            "module-native-protocol-unix socket=" + directory.path("pulse.sock") +
                " auth-anonymous=1",
            "-L", "module-null-sink sink_name=out norewinds=1 rate=16000 channels=1", "-L",
            std::string("module-remap-source master=out.monitor source_name=") + SOURCE_NAME},
        environment.getVariables());
    std::string piece = process->read();
    while (!piece.empty() && output.find(READY_LINE) == std::string::npos) {
        output += piece;
        if (output.find(READY_LINE) == std::string::npos) {
            piece = process->read();
        }
    }
    drainer = std::thread([this] { drain(); });
    running = output.find(READY_LINE) != std::string::npos &&
              control({"set-default-source", SOURCE_NAME}).exitStatus == 0;
}

PulseServer::~PulseServer() {
    kill();
    if (drainer.joinable()) {
        drainer.join();
    }
}

bool PulseServer::play(const std::vector<int16_t>& samples) {
    const std::string path = directory.path("sound.raw");
    std::ofstream file(path, std::ios::binary);
    for (const int16_t sample : samples) {
        const auto value = static_cast<uint16_t>(sample);
        file.put(static_cast<char>(value & 0xFFU)).put(static_cast<char>(value >> 8));
    }
    file.close();
    return ChildProcess::run(
               {"paplay", "--raw", "--rate=16000", "--channels=1", "--format=s16le", path},
               environment.getVariables())
               .exitStatus == 0;
}

ChildProcess::Result PulseServer::control(const std::vector<std::string>& arguments) {
    std::vector<std::string> words = {"pactl"};
    words.insert(words.end(), arguments.begin(), arguments.end());
    return ChildProcess::run(words, environment.getVariables());
}

void PulseServer::kill() {
    if (process) {
        process->sendSignal(SIGKILL);
    }
}

void PulseServer::freeze() {
    if (process) {
        process->sendSignal(SIGSTOP);
    }
}

void PulseServer::thaw() {
    if (process) {
        process->sendSignal(SIGCONT);
    }
}

// The server's log must not fill its pipe.
void PulseServer::drain() {
    while (!process->read().empty()) {
    }
}

}  // namespace TestSupport
