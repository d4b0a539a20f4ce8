#pragma once

#include <map>
#include <mutex>
#include <utility>

#include "pal/kd_event.h"

namespace korvel_pal {

/** Routes events by type and user pointer. Never destroyed, like the event loop. */
class CallbackTable {
  public:
    static CallbackTable& instance();

    /** A null `func` removes the registration. */
    void install(KDCallbackFunc* func, KDint type, void* userptr);

    /** Under the event lock; an event that nobody has registered for is dropped. */
    void deliver(const KDEvent& event);

  private:
    CallbackTable() = default;

    std::mutex mutex;
    std::map<std::pair<KDint, void*>, KDCallbackFunc*> callbacks;
};

}  // namespace korvel_pal
