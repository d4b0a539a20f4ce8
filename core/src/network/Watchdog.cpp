#include "network/Watchdog.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "core/util/Time.h"
#include "pal/kd_event.h"
#include "pal/kd_time.h"

namespace Network {

namespace {

using Util::NS_PER_MS;
constexpr int64_t NOT_WAITING = std::numeric_limits<int64_t>::min();

}  // namespace

Watchdog::Watchdog(int timeoutMs, std::function<void()> onSuspicion)
    : timeoutNs(std::max(timeoutMs, 0) * NS_PER_MS),
      suspicion(std::move(onSuspicion)),
      waitingSince(NOT_WAITING),
      timer([this] { onTimer(); }) {}

void Watchdog::start() {
    progress();
    if (timeoutNs > 0) {
        timer.start(KD_TIMER_ONESHOT, timeoutNs);
    }
}

void Watchdog::stop() {
    timer.cancel();
}

void Watchdog::progress() {
    waitingSince = kdGetTimeUST();
}

void Watchdog::pause() {
    waitingSince = NOT_WAITING;
}

bool Watchdog::hasExpired() const {
    return timeoutNs > 0 && getTimeLeft() <= 0;
}

int64_t Watchdog::getTimeLeft() const {
    const int64_t since = waitingSince;
    if (since == NOT_WAITING) {
        return timeoutNs;
    }
    return timeoutNs - std::max<int64_t>(kdGetTimeUST() - since, 0);
}

void Watchdog::onTimer() {
    const int64_t timeLeft = getTimeLeft();
    timer.start(KD_TIMER_ONESHOT, timeLeft > 0 ? timeLeft : timeoutNs);
    if (timeLeft <= 0) {
        suspicion();
    }
}

}  // namespace Network
