#include "Interrupts.h"

#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <system_error>
#include <utility>

namespace Cli {

namespace {

const int STATUS_INTERRUPTED = 130;
const char BYTE_INTERRUPT = 'i';
const char BYTE_END = 'e';

// What a signal handler may touch.
std::atomic<int> signalCount{0};
std::atomic<int> pipeWriteEnd{-1};
int pipeReadEnd = -1;
struct sigaction oldInterrupt;
struct sigaction oldTerminate;

void tell(char byte) {
    while (write(pipeWriteEnd.load(), &byte, 1) < 0 && errno == EINTR) {
    }
}

void onSignal(int /*number*/) {
    const int savedErrno = errno;
    if (signalCount.fetch_add(1) > 0) {
        _exit(STATUS_INTERRUPTED);
    }
    tell(BYTE_INTERRUPT);
    errno = savedErrno;
}

}  // namespace

Interrupts::Interrupts(std::function<void()> onInterrupt) : callback(std::move(onInterrupt)) {
    int ends[2] = {-1, -1};
    if (pipe(ends) != 0) {
        return;  // Ctrl-C then keeps its usual effect.
    }
    pipeReadEnd = ends[0];
    pipeWriteEnd = ends[1];
    signalCount = 0;
    try {
        watcher = std::thread([this] { watch(); });
    } catch (const std::system_error&) {
        close(pipeWriteEnd.exchange(-1));
        close(pipeReadEnd);
        return;
    }

    struct sigaction action = {};
    action.sa_handler = onSignal;
    action.sa_flags = SA_RESTART;
    sigemptyset(&action.sa_mask);
    sigaction(SIGINT, &action, &oldInterrupt);
    sigaction(SIGTERM, &action, &oldTerminate);
}

Interrupts::~Interrupts() {
    if (!watcher.joinable()) {
        return;
    }
    sigaction(SIGINT, &oldInterrupt, nullptr);
    sigaction(SIGTERM, &oldTerminate, nullptr);
    tell(BYTE_END);
    watcher.join();
    close(pipeWriteEnd.exchange(-1));
    close(pipeReadEnd);
}

void Interrupts::watch() const {
    for (;;) {
        char byte = BYTE_END;
        const ssize_t count = read(pipeReadEnd, &byte, 1);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0 || byte == BYTE_END) {
            return;
        }
        callback();
    }
}

}  // namespace Cli
