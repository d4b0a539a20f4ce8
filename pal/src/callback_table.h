#pragma once

#include <map>
#include <mutex>
#include <utility>

#include "immortal.h"
#include "pal/kd_event.h"

namespace korvel_pal {

/** Routes events by type and user pointer. Never destroyed, like the event loop. */
class CallbackTable {
  public:
    static CallbackTable& instance();

    /** A null `func` removes the registration. May throw `std::bad_alloc`, without effect. */
    void install(KDCallbackFunc* func, KDint type, void* userptr);

    /** Under the event lock; an event without a registration is dropped. */
    void deliver(const KDEvent& event);

    /** As `deliver`, to every registration for the event's type, with its own user pointer. */
    void deliverToAll(KDEvent event);

  private:
    friend class Immortal<CallbackTable>;
    using Key = std::pair<KDint, void*>;

    CallbackTable() = default;

    std::mutex mutex;
    std::map<Key, KDCallbackFunc*> callbacks;
};

}  // namespace korvel_pal
