#include "core/util/Timer.h"

#include <boost/enable_shared_from_this.hpp>
#include <boost/make_shared.hpp>
#include <new>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/kd_assert.h"
#include "pal/kd_event.h"

namespace Util {

namespace {

bool isTimerType(int type) {
    return type == KD_TIMER_ONESHOT || type == KD_TIMER_PERIODIC_AVERAGE ||
           type == KD_TIMER_PERIODIC_MINIMUM;
}

}  // namespace

struct Timer::State : boost::enable_shared_from_this<Timer::State> {
    explicit State(std::function<void()> function) : callback(std::move(function)) {}

    void cancel() {
        if (handle != nullptr) {
            kdCancelTimer(handle);
            handle = nullptr;
        }
    }

    // With the first start: most requests end without a use for their timers.
    void install() {
        if (!isInstalled && kdInstallCallback(&State::onTimer, KD_EVENT_TIMER, this) != 0) {
            throw std::bad_alloc();
        }
        isInstalled = true;
    }

    void uninstall() {
        if (isInstalled) {
            kdInstallCallback(nullptr, KD_EVENT_TIMER, this);
        }
    }

    static void onTimer(const KDEvent* event) {
        // The function may destroy the timer.
        const boost::shared_ptr<State> self =
            static_cast<State*>(event->userptr)->shared_from_this();
        if (self->type == KD_TIMER_ONESHOT) {
            self->cancel();
        }
        self->callback();
    }

    const std::function<void()> callback;
    bool isInstalled = false;
    KDTimer* handle = nullptr;
    int type = KD_TIMER_ONESHOT;
};

Timer::Timer(std::function<void()> callback)
    : state(boost::make_shared<State>(std::move(callback))) {
    KOR_ASSERT(state->callback);
}

Timer::~Timer() {
    const EventLock lock;
    state->cancel();
    state->uninstall();
}

void Timer::start(int type, int64_t periodNs) {
    const EventLock lock;
    if (!KOR_ASSERT(state->callback)) {
        return;
    }
    state->cancel();
    state->install();
    state->type = type;
    state->handle = kdSetTimer(periodNs, type, state.get());
    if (state->handle == nullptr && isTimerType(type)) {
        throw std::bad_alloc();
    }
    KOR_ASSERT(state->handle);
}

void Timer::cancel() {
    const EventLock lock;
    state->cancel();
}

bool Timer::isRunning() const {
    const EventLock lock;
    return state->handle != nullptr;
}

}  // namespace Util
