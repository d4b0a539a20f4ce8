#pragma once

#include <atomic>
#include <cstdint>
#include <functional>

#include "core/util/Timer.h"

namespace Network {

/**
 * Measures on the platform clock how long a peer keeps us waiting. `progress` and `pause` are
 * cheap: they only note the time, and the timer finds out when it is due whether there is reason
 * for suspicion.
 */
class Watchdog {
  public:
    /**
     * @param timeoutMs below 1 for no bound
     * @param onSuspicion called on the event thread under the event lock; whether the peer is late
     *                    indeed is then asked with `hasExpired`
     */
    Watchdog(int timeoutMs, std::function<void()> onSuspicion);

    void start();
    void stop();

    /** The peer did something, or owes something from now on. Any thread. */
    void progress();
    /** The peer owes nothing until the next `progress`. Any thread. */
    void pause();

    /** Any thread. */
    bool hasExpired() const;

  private:
    int64_t getTimeLeft() const;
    void onTimer();

    const int64_t timeoutNs;
    const std::function<void()> suspicion;
    std::atomic<int64_t> waitingSince;
    Util::Timer timer;
};

}  // namespace Network
