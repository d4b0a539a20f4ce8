#include "ToolProcess.h"

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <stdexcept>

extern char** environ;

namespace TestSupport {

namespace {

const int WAIT_MS = 30000;

struct Pipe {
    int read = -1;
    int write = -1;

    Pipe() {
        int ends[2] = {-1, -1};
        if (pipe2(ends, O_CLOEXEC) != 0) {
            throw std::runtime_error("no pipe");
        }
        read = ends[0];
        write = ends[1];
    }
};

void closeEnd(int& end) {
    if (end >= 0) {
        close(end);
        end = -1;
    }
}

/** Appends what there is; closes the end when there is no more to come. */
void drain(int& end, std::string& text) {
    char block[4096];
    const ssize_t count = read(end, block, sizeof block);
    if (count > 0) {
        text.append(block, static_cast<std::size_t>(count));
    } else if (count == 0 || errno != EINTR) {
        closeEnd(end);
    }
}

void feed(int& end, std::string& text) {
    const ssize_t count = write(end, text.data(), text.size());
    if (count > 0) {
        text.erase(0, static_cast<std::size_t>(count));
    }
    if (text.empty() || (count < 0 && errno != EINTR && errno != EAGAIN)) {
        closeEnd(end);
    }
}

}  // namespace

ToolProcess::ToolProcess(const std::string& program, const std::vector<std::string>& arguments,
                         const std::string& inputText)
    : input(inputText) {
    // The tool may end before it has read its input.
    std::signal(SIGPIPE, SIG_IGN);
    const Pipe inPipe;
    const Pipe outPipe;
    const Pipe errPipe;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, inPipe.read, STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, outPipe.write, STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, errPipe.write, STDERR_FILENO);

    std::vector<std::string> words = {program};
    words.insert(words.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    std::transform(words.begin(), words.end(), std::back_inserter(argv),
                   [](std::string& word) { return word.data(); });
    argv.push_back(nullptr);
    const int error = posix_spawn(&pid, program.c_str(), &actions, nullptr, argv.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    close(inPipe.read);
    close(outPipe.write);
    close(errPipe.write);
    inputEnd = inPipe.write;
    outEnd = outPipe.read;
    errEnd = errPipe.read;
    if (error != 0) {
        throw std::runtime_error("cannot run " + program);
    }
    fcntl(inputEnd, F_SETFL, O_NONBLOCK);
    if (input.empty()) {
        closeEnd(inputEnd);
    }
}

ToolProcess::~ToolProcess() {
    closeEnd(inputEnd);
    closeEnd(outEnd);
    closeEnd(errEnd);
    if (pid > 0) {
        kill(pid, SIGKILL);
        waitpid(pid, nullptr, 0);
    }
}

bool ToolProcess::readMore() {
    pollfd ends[] = {{outEnd, POLLIN, 0}, {errEnd, POLLIN, 0}, {inputEnd, POLLOUT, 0}};
    const int ready = poll(ends, 3, WAIT_MS);
    if (ready == 0) {
        kill(pid, SIGKILL);
        result.err += "(killed by the test after waiting in vain)";
        return false;
    }
    if (ready > 0 && ends[0].revents != 0) {
        drain(outEnd, result.out);
    }
    if (ready > 0 && ends[1].revents != 0) {
        drain(errEnd, result.err);
    }
    if (ready > 0 && ends[2].revents != 0) {
        feed(inputEnd, input);
    }
    return outEnd >= 0 || errEnd >= 0;
}

std::string ToolProcess::waitForLine(const std::string& part) {
    for (;;) {
        const std::size_t found = result.out.find(part);
        const std::size_t end = result.out.find('\n', found);
        if (found != std::string::npos && end != std::string::npos) {
            const std::size_t before = result.out.rfind('\n', found);
            const std::size_t begin = before == std::string::npos ? 0 : before + 1;
            return result.out.substr(begin, end - begin);
        }
        if (outEnd < 0 || !readMore()) {
            return "";
        }
    }
}

void ToolProcess::signal(int number) const {
    kill(pid, number);
}

ToolResult ToolProcess::wait() {
    while ((outEnd >= 0 || errEnd >= 0) && readMore()) {
    }
    int status = 0;
    waitpid(pid, &status, 0);
    pid = -1;
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return result;
}

ToolResult runTalvox(const std::vector<std::string>& arguments, const std::string& input) {
    ToolProcess process(TALVOX_BINARY, arguments, input);
    return process.wait();
}

}  // namespace TestSupport
