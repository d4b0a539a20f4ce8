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

#include "support/Spawn.h"

namespace TestSupport {

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
