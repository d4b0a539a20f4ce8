#pragma once

#include <cstddef>
#include <functional>
#include <utility>
#include <vector>

#include "pal/kd_event.h"

namespace PalTest {

/** Receives the events of one timer under the event lock. */
class Ticker {
  public:
    explicit Ticker(std::function<void(const KDEvent&)> then = {}) : reaction(std::move(then)) {
        kdInstallCallback(&Ticker::onEvent, KD_EVENT_TIMER, this);
    }
    ~Ticker() {
        kdEventLockKOR();
        cancel();
        kdInstallCallback(nullptr, KD_EVENT_TIMER, this);
        kdEventUnlockKOR();
    }
    Ticker(const Ticker&) = delete;
    Ticker& operator=(const Ticker&) = delete;

    void start(KDint64 intervalNs, KDint type = KD_TIMER_ONESHOT) {
        kdEventLockKOR();
        cancel();
        handle = kdSetTimer(intervalNs, type, this);
        kdEventUnlockKOR();
    }

    KDint cancel() {
        const KDint result = kdCancelTimer(handle);
        handle = nullptr;
        return result;
    }

    KDTimer* timer() const { return handle; }
    std::size_t count() const { return due.size(); }

    std::vector<KDust> due;  // the events' timestamps

  private:
    static void onEvent(const KDEvent* event) {
        auto* self = static_cast<Ticker*>(event->userptr);
        self->due.push_back(event->timestamp);
        if (self->reaction) {
            self->reaction(*event);
        }
    }

    std::function<void(const KDEvent&)> reaction;
    KDTimer* handle = nullptr;
};

}  // namespace PalTest
