#include "Victim.h"

#include <execinfo.h>
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <dlfcn.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <new>
#include <string>

#include "Control.h"
#include "Order.h"
#include "Pipe.h"
#include "Plan.h"
#include "Room.h"
#include "SessionRun.h"
#include "core/sound/Recorder.h"
#include "logcollector/LogCollector.h"
#include "pal/kd.h"
#include "support/AbortOnAssertion.h"
#include "support/Threads.h"

#if defined(__SANITIZE_ADDRESS__)
// NOLINTBEGIN(bugprone-reserved-identifier): the name that the sanitizer looks for.
extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions();

// It knows the loader's own memory by its caller, which is the preloaded library here. TinyXML
// loses the node that it reads when memory runs out.
extern "C" const char* __lsan_default_suppressions() {
    return "leak:ld-linux\nleak:TiXmlNode::Identify";
}
// NOLINTEND(bugprone-reserved-identifier)
#endif

namespace Torture {

namespace {

constexpr int POINT_LIMIT_MS = 60000;
constexpr std::int64_t NS_PER_MS = 1000000;
constexpr std::int64_t CLOCK_START_NS = 1000000 * NS_PER_MS;
constexpr std::int64_t RECORDS_WAIT_MS = 120000;

/** The sound of an utterance, its header, and a little more. */
constexpr long PAGES_OF_A_DUMP = 12;
constexpr std::size_t OUTPUT_MAX = 65536;
constexpr unsigned REST_STEP_US = 5000;
constexpr int REST_STEPS_MAX = 1000;
constexpr int REST_STEPS_UNCHANGED = 60;

Report* shared = nullptr;
SessionOutcome* current = nullptr;

std::int64_t nowNs() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<std::int64_t>(now.tv_sec) * 1000 * NS_PER_MS + now.tv_nsec;
}

/** Keeps the log in the report. Called by one thread at a time. */
void keepLine(const char* message, void* /*user*/) {
    const Harness harness;
    Report& report = *shared;
    if (current != nullptr) {
        ++current->logged;
    }
    const std::size_t length = std::strlen(message);
    if (report.logSize + length + 2 < sizeof(report.log)) {
        std::memcpy(report.log + report.logSize, message, length);
        report.log[report.logSize + length] = '\n';
        report.logSize += length + 1;
    }
}

#if !defined(__SANITIZE_ADDRESS__)
/** Writes the stack, where no sanitizer does. */
void onFatalSignal(int number) {
    const Harness harness;
    std::array<void*, STACK_MAX> stack{};
    const int depth = backtrace(stack.data(), STACK_MAX);
    backtrace_symbols_fd(stack.data(), depth, STDERR_FILENO);
    signal(number, SIG_DFL);
    raise(number);
}

void catchFatalSignals() {
    for (const int number : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT}) {
        signal(number, &onFatalSignal);
    }
}
#else
// AddressSanitizer does.
void catchFatalSignals() {}
#endif

void printFailure() {
    using Getter = const Failure* (*)();
    const auto get = reinterpret_cast<Getter>(dlsym(RTLD_DEFAULT, "tortureFailure"));
    if (get != nullptr && get()->depth > 0) {
        std::fprintf(stderr, "The call that failed:\n");
        std::fflush(stderr);
        backtrace_symbols_fd(const_cast<void**>(get()->stack), get()->depth, STDERR_FILENO);
    }
}

void runSession(const Plan& plan, const Order& order, SessionRun::Turn turn,
                SessionOutcome& outcome) {
    current = &outcome;
    SessionRun session(plan, order, turn, outcome);
    session.run();
}

bool isConnection(int descriptor) {
    sockaddr_storage address{};
    socklen_t size = sizeof(address);
    return getsockname(descriptor, reinterpret_cast<sockaddr*>(&address), &size) == 0 &&
           address.ss_family != AF_UNIX;
}

Holdings countHoldings() {
    Holdings holdings;
    holdings.threads = TestSupport::countThreadsButWorkers();
    std::error_code ignored;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd", ignored)) {
        const int descriptor = std::atoi(entry.path().filename().c_str());
        ++(isConnection(descriptor) ? holdings.connections : holdings.descriptors);
    }
    return holdings;
}

bool isWithin(const Holdings& found, const Holdings& wanted) {
    return found.threads == wanted.threads && found.descriptors == wanted.descriptors &&
           found.connections <= wanted.connections;
}

bool isSame(const Holdings& one, const Holdings& other) {
    return isWithin(one, other) && isWithin(other, one);
}

/**
 * Threads of requests and of recorders end by themselves, soon after the session. Without numbers
 * to wait for, the process is at rest when it has not changed for a while.
 */
void awaitRest(const Order& order, Report& report) {
    const bool isKnown = order.holdings.threads > 0;
    const int patience = isKnown ? REST_STEPS_MAX : REST_STEPS_UNCHANGED;
    for (int step = 0; step < patience; ++step) {
        const Holdings now = countHoldings();
        if (!isKnown && !isSame(now, report.holdings)) {
            step = 0;
        }
        report.holdings = now;
        if (isKnown && isWithin(now, order.holdings)) {
            return;
        }
        usleep(REST_STEP_US);  // nothing signals what /proc shows
    }
}

/** Everything that a sound engine has is there now. */
void settle(const Order& order, Report& report) {
    if (LogCollector::isLoggingEnabled()) {
        for (std::int64_t waited = 0;
             LogCollector::getPendingCount() > 0 && waited < RECORDS_WAIT_MS; waited += 1000) {
            kdAdvanceClockKOR(1000 * NS_PER_MS);
            kdDrainEventsKOR();
            usleep(2000);  // the network thread and the server have work, in real time
        }
        report.pendingRecords = LogCollector::getPendingCount();
    }
    awaitRest(order, report);
}

void checkDump(const Plan& plan, const Order& order, Report& report, bool isWhole) {
    if (plan.dumps && report.dumpFault[0] == '\0') {
        const std::string fault = findDumpFault(std::string(order.directory) + "/in.wav", isWhole);
        std::snprintf(report.dumpFault, sizeof(report.dumpFault), "%s", fault.c_str());
    }
}

/** The session in which something fails. */
void runFirst(const Plan& plan, const Order& order, Report& report) {
    const Room room(order, report);
    report.stage = Stage::SESSION;
    arm(order, report);
    runSession(plan, order, SessionRun::Turn::FIRST, report.first);
    disarm(report);
    report.calls[static_cast<int>(Kind::SPACE)] = plan.dumps ? PAGES_OF_A_DUMP : 0;
    if (order.kind == static_cast<int>(Kind::SPACE)) {
        checkDump(plan, order, report, false);
    }
}

void runPoint(const Order& order, Report& report) {
    const Plan& plan = getPlans()[static_cast<std::size_t>(order.session)];
    static const Harness harness;
    TestSupport::abortOnAssertion();
    catchFatalSignals();
    kdSetLogSinkKOR(&keepLine, nullptr);
    kdUseManualClockKOR(CLOCK_START_NS);
    SessionOutcome warmUp;
    if (plan.warm) {
        runSession(plan, order, SessionRun::Turn::NEXT, warmUp);
    }
    runFirst(plan, order, report);
    printFailure();
    report.stage = Stage::NEXT_SESSION;
    runSession(plan, order, SessionRun::Turn::NEXT, report.next);
    current = nullptr;
    report.stage = Stage::SETTLES;
    checkDump(plan, order, report, true);
    settle(order, report);
    Sound::Recorder::setFactory({});
    report.stage = Stage::EXITS;
    report.exitBeganNs = nowNs();
}

void becomeVictim(const Order& order, Report& report, int output) {
    dup2(output, STDOUT_FILENO);
    dup2(output, STDERR_FILENO);
    shared = &report;
    runPoint(order, report);
}

/** @return whether the process ended in time */
bool waitForEnd(pid_t pid) {
    const int handle = static_cast<int>(syscall(SYS_pidfd_open, pid, 0));
    pollfd entry{handle, POLLIN, 0};
    const bool ended = poll(&entry, 1, POINT_LIMIT_MS) > 0;
    close(handle);
    return ended;
}

std::string readOutput(int file) {
    std::string output(OUTPUT_MAX, '\0');
    const ssize_t size = pread(file, output.data(), output.size(), 0);
    output.resize(size > 0 ? static_cast<std::size_t>(size) : 0);
    return output;
}

}  // namespace

int serveOrders(int input, int output) {
    void* const memory =
        mmap(nullptr, sizeof(Report), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    Order order;
    while (readAll(input, &order, sizeof(order))) {
        auto* const report = new (memory) Report;
        const int file = memfd_create("output", MFD_CLOEXEC);
        const pid_t pid = fork();
        if (pid == 0) {
            becomeVictim(order, *report, file);
            return 0;  // the way out of `main` is part of the point
        }
        Verdict verdict;
        verdict.timedOut = waitForEnd(pid) ? 0 : 1;
        if (verdict.timedOut != 0) {
            kill(pid, SIGABRT);
            usleep(300000);  // for the stack that the sanitizer writes
            kill(pid, SIGKILL);
        }
        waitpid(pid, &verdict.status, 0);
        const std::int64_t endedNs = nowNs();
        // Both processes have the library at the same place.
        if (report->failedFunction != nullptr) {
            std::snprintf(report->failed, sizeof(report->failed), "%s", report->failedFunction);
        }
        verdict.report = *report;
        if (report->stage == Stage::EXITS) {
            verdict.exitMs = (endedNs - report->exitBeganNs) / NS_PER_MS;
        }
        const std::string text = readOutput(file);
        close(file);
        verdict.outputSize = text.size();
        if (!writeAll(output, &verdict, sizeof(verdict)) ||
            !writeAll(output, text.data(), text.size())) {
            return 1;
        }
    }
    return 0;
}

}  // namespace Torture
