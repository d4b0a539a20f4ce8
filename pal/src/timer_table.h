#pragma once

#include <cstdint>
#include <limits>
#include <map>
#include <mutex>
#include <utility>

#include "handle_table.h"
#include "immortal.h"
#include "kept_nodes.h"
#include "pal/kd_event.h"

namespace korvel_pal {

/**
 * All timers, in the order in which they become due. On the real clock the event loop fires them,
 * on the hand-driven one whoever moves it. Never destroyed, like the event loop.
 */
class TimerTable {
  public:
    static constexpr std::int64_t NEVER = -1;

    static TimerTable& instance();

    /** Null when there is no memory, or no event thread to fire it. */
    KDTimer* start(std::int64_t intervalNs, KDint type, void* userptr);
    bool cancel(KDTimer* handle);

    /**
     * Nanoseconds until the event loop has to call `fireDue`, or `NEVER`. It is expected to do so
     * then: until that time it is only woken for timers that are due earlier.
     */
    std::int64_t timeToNext();

    /** Fires what is due on the real clock. */
    void fireDue();

    void useManualClock(std::int64_t now);
    void useRealClock();
    void advanceManualClock(std::int64_t nanoseconds);

  private:
    friend class Immortal<TimerTable>;

    struct Timer {
        std::int64_t due;
        std::uint64_t order;
        std::int64_t intervalNs;
        KDint type;
        void* userptr;
        bool waiting;
    };
    using Queue = std::map<std::pair<std::int64_t, std::uint64_t>, KDTimer*>;

    TimerTable() = default;

    KDTimer* add(std::int64_t intervalNs, KDint type, void* userptr);
    void enqueue(Queue::node_type node, Timer& timer, std::int64_t due);
    bool takeDue(std::int64_t limit, bool manual, KDEvent& event);
    template <typename SwitchClock>
    void switchClock(SwitchClock change);

    std::mutex mutex;
    HandleTable<KDTimer, Timer> timers;
    Queue queue;
    KeptNodes<Queue> keptEntries;
    std::uint64_t startedCount = 0;
    std::int64_t loopWakesAt = std::numeric_limits<std::int64_t>::max();
};

}  // namespace korvel_pal
