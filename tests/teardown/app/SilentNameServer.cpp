#include "SilentNameServer.h"

#include <dlfcn.h>
#include <netdb.h>

#include <chrono>
#include <condition_variable>
#include <cstring>
#include <mutex>

namespace TearDown {

const char* const SILENT_HOST = "silent.invalid";

namespace {

constexpr std::chrono::seconds LONGEST_WAIT{30};

struct State {
    std::mutex mutex;
    std::condition_variable changed;
    int asked = 0;
    int released = 0;
};

// Never destroyed: its questions outlive everything.
State& state() {
    static auto* const made = new State;
    return *made;
}

void hang() {
    std::unique_lock<std::mutex> lock(state().mutex);
    const int number = ++state().asked;
    state().changed.notify_all();
    state().changed.wait(lock, [number] { return state().released >= number; });
}

}  // namespace

bool waitForQuestions(int count) {
    std::unique_lock<std::mutex> lock(state().mutex);
    return state().changed.wait_for(lock, LONGEST_WAIT, [count] { return state().asked >= count; });
}

void answerQuestions() {
    const std::lock_guard<std::mutex> lock(state().mutex);
    state().released = state().asked;
    state().changed.notify_all();
}

}  // namespace TearDown

// In front of the C library's function for this program and the libraries that it loads.
extern "C" __attribute__((visibility("default"))) int getaddrinfo(const char* node,
                                                                  const char* service,
                                                                  const addrinfo* hints,
                                                                  addrinfo** result) {
    if (node != nullptr && std::strcmp(node, TearDown::SILENT_HOST) == 0) {
        TearDown::hang();
        return EAI_AGAIN;
    }
    using Function = int (*)(const char*, const char*, const addrinfo*, addrinfo**);
    static const auto real = reinterpret_cast<Function>(::dlsym(RTLD_NEXT, "getaddrinfo"));
    return real(node, service, hints, result);
}
