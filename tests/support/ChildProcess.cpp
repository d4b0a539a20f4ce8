#include "support/ChildProcess.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <sstream>

extern char** environ;

namespace TestSupport {

namespace {

/** The test's environment with `changes`, as text lines. */
std::vector<std::string> mergeEnvironment(const ChildProcess::Environment& changes) {
    std::vector<std::string> lines;
    for (const auto& change : changes) {
        lines.push_back(change.first + "=" + change.second);
    }
    for (char** entry = environ; *entry != nullptr; ++entry) {
        const std::string line(*entry);
        bool changed = false;
        for (const auto& change : changes) {
            changed = changed || line.compare(0, change.first.size() + 1, change.first + "=") == 0;
        }
        if (!changed) {
            lines.push_back(line);
        }
    }
    return lines;
}

std::vector<char*> toPointers(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    for (std::string& text : texts) {
        pointers.push_back(text.data());
    }
    pointers.push_back(nullptr);
    return pointers;
}

}  // namespace

bool ChildProcess::isInstalled(const std::string& program) {
    const char* path = std::getenv("PATH");
    std::istringstream folders(path != nullptr ? path : "");
    for (std::string folder; std::getline(folders, folder, ':');) {
        if (access((std::filesystem::path(folder) / program).c_str(), X_OK) == 0) {
            return true;
        }
    }
    return false;
}

ChildProcess::Result ChildProcess::run(const std::vector<std::string>& arguments,
                                       const Environment& environment) {
    ChildProcess process(arguments, environment);
    Result result;
    for (std::string piece = process.read(); !piece.empty(); piece = process.read()) {
        result.output += piece;
    }
    result.exitStatus = process.wait();
    return result;
}

ChildProcess::ChildProcess(const std::vector<std::string>& arguments,
                           const Environment& environment) {
    std::vector<std::string> words = arguments;
    std::vector<std::string> variables = mergeEnvironment(environment);
    const std::vector<char*> argv = toPointers(words);
    const std::vector<char*> envp = toPointers(variables);
    std::array<int, 2> ends = {-1, -1};
    if (pipe2(ends.data(), O_CLOEXEC) != 0) {
        return;
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDERR_FILENO);
    if (posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), envp.data()) != 0) {
        pid = -1;
    }
    posix_spawn_file_actions_destroy(&actions);
    close(ends[1]);
    output = ends[0];
}

ChildProcess::~ChildProcess() {
    sendSignal(SIGKILL);
    wait();
    if (output >= 0) {
        close(output);
    }
}

std::string ChildProcess::read() {
    std::array<char, 4096> bytes;
    ssize_t count = -1;
    do {
        count = ::read(output, bytes.data(), bytes.size());
    } while (count < 0 && errno == EINTR);
    return count > 0 ? std::string(bytes.data(), static_cast<std::size_t>(count)) : std::string();
}

void ChildProcess::sendSignal(int number) {
    if (pid > 0) {
        kill(pid, number);
    }
}

int ChildProcess::wait() {
    if (pid <= 0) {
        return -1;
    }
    int status = 0;
    pid_t ended = -1;
    do {
        ended = waitpid(pid, &status, 0);
    } while (ended < 0 && errno == EINTR);
    pid = -1;
    return ended > 0 && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

}  // namespace TestSupport
