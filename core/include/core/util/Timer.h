/**
 * @file
 * A timer that belongs to one owner.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <functional>

#include "core/Export.h"

namespace Util {

/**
 * Calls a function once or periodically on the event thread (or on the thread that moves the
 * hand-driven clock), under the event lock.
 *
 * All operations take the event lock. After `cancel` or the destructor has returned the function
 * is not called any more. The function may restart, cancel or destroy the timer.
 */
class KORVEL_CORE_API Timer {
  public:
    /**
     * Throws `std::bad_alloc` when there is no memory.
     * @param callback must not be empty. What it throws ends the call only; see
     *                 `kdReportExceptionKOR`.
     */
    explicit Timer(std::function<void()> callback);
    ~Timer();
    Timer(const Timer&) = delete;
    Timer& operator=(const Timer&) = delete;

    /**
     * Starts the timer, anew if it runs.
     * @param type     `KD_TIMER_ONESHOT` (61) or `KD_TIMER_PERIODIC_AVERAGE` (62)
     * @param periodNs time to the first call, and between further ones, in nanoseconds
     *
     * Throws `std::bad_alloc` when there is no memory, or no event thread to call the function; the
     * timer does not run then. A periodic timer that runs needs neither.
     */
    void start(int type, int64_t periodNs);

    /** Ends the timer; does nothing when it does not run. */
    void cancel();

    /** True from `start` until `cancel` or the call of a one-shot timer. */
    bool isRunning() const;

  private:
    struct State;
    boost::shared_ptr<State> state;
};

}  // namespace Util
