#include "Worker.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <vector>

#include "Pipe.h"
#include "support/Spawn.h"

namespace Torture {

namespace {

constexpr int ORDERS = 3;
constexpr int ANSWERS = 4;

/**
 * The sanitizer accepts the library before itself; an abort shows its stack, and a leak its whole
 * stack, through libraries without frame pointers.
 */
TestSupport::Environment makeEnvironment(const std::string& library) {
    const char* const before = std::getenv("ASAN_OPTIONS");
    return {{"LD_PRELOAD", library},
            {"ASAN_OPTIONS", (before != nullptr ? std::string(before) + ":" : std::string()) +
                                 "verify_asan_link_order=0:handle_abort=1:"
                                 "detect_leaks=1:exitcode=77:fast_unwind_on_malloc=0"}};
}

}  // namespace

Worker::Worker(const std::string& program, const std::string& library) {
    std::vector<std::string> words = {program, "--serve"};
    std::vector<std::string> lines = TestSupport::mergeEnvironment(makeEnvironment(library));
    const std::vector<char*> argv = TestSupport::toPointers(words);
    const std::vector<char*> envp = TestSupport::toPointers(lines);
    std::array<int, 2> down = {-1, -1};
    std::array<int, 2> up = {-1, -1};
    if (pipe2(down.data(), O_CLOEXEC) != 0 || pipe2(up.data(), O_CLOEXEC) != 0) {
        return;
    }
    // Out of the way of the numbers that the new process has for them.
    const int input = fcntl(down[0], F_DUPFD_CLOEXEC, 10);
    const int output = fcntl(up[1], F_DUPFD_CLOEXEC, 10);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input, ORDERS);
    posix_spawn_file_actions_adddup2(&actions, output, ANSWERS);
    if (posix_spawn(&pid, argv[0], &actions, nullptr, argv.data(), envp.data()) != 0) {
        pid = -1;
    }
    posix_spawn_file_actions_destroy(&actions);
    for (const int used : {down[0], up[1], input, output}) {
        close(used);
    }
    orders = down[1];
    answers = up[0];
}

Worker::~Worker() {
    close(orders);
    close(answers);
    if (pid > 0) {
        waitpid(pid, nullptr, 0);
    }
}

Answer Worker::serve(const Order& order) {
    Answer answer;
    if (writeAll(orders, &order, sizeof(order)) &&
        readAll(answers, &answer.verdict, sizeof(answer.verdict))) {
        answer.output.resize(answer.verdict.outputSize);
        answer.served = readAll(answers, answer.output.data(), answer.output.size());
    }
    return answer;
}

}  // namespace Torture
