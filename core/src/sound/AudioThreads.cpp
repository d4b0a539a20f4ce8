#include "sound/AudioThreads.h"

#include <pthread.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <exception>
#include <mutex>
#include <thread>
#include <vector>

#include "pal/SignalsBlocked.h"

namespace Sound {

namespace {

// A thread that runs ends as soon as it is woken; one that hangs is not worth waiting for.
const std::chrono::milliseconds END_WAIT_MAX(10);

struct Running {
    std::mutex mutex;
    std::condition_variable changed;
    std::vector<boost::shared_ptr<PulseCapture>> captures;

    void remove(const boost::shared_ptr<PulseCapture>& capture) {
        captures.erase(std::remove(captures.begin(), captures.end(), capture), captures.end());
    }
};

// Never destroyed: a thread that hangs in the client library may outlive everything else.
Running& running() {
    static auto* const instance = new Running;
    return *instance;
}

void runCapture(const boost::shared_ptr<PulseCapture>& capture) {
    pthread_setname_np(pthread_self(), AudioThreads::NAME);
    capture->run();
    // Not at the thread's very end: the C++ library forgets such duties, and keeps the lock, when
    // the process ends first.
    const std::lock_guard<std::mutex> lock(running().mutex);
    running().remove(capture);
    running().changed.notify_all();
}

}  // namespace

AudioThreads::~AudioThreads() {
    std::unique_lock<std::mutex> lock(running().mutex);
    for (const boost::shared_ptr<PulseCapture>& capture : running().captures) {
        capture->end();
    }
    running().changed.wait_for(lock, END_WAIT_MAX, [] { return running().captures.empty(); });
}

bool AudioThreads::start(const boost::shared_ptr<PulseCapture>& capture) {
    const korvel_pal::SignalsBlocked signalsBlocked;
    const std::lock_guard<std::mutex> lock(running().mutex);
    running().captures.push_back(capture);
    try {
        std::thread(&runCapture, capture).detach();
    } catch (const std::exception&) {
        running().captures.pop_back();
        return false;
    }
    return true;
}

}  // namespace Sound
