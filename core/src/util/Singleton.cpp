#include "core/util/Singleton.h"

#include <algorithm>
#include <vector>

#include "pal/kd_event.h"

namespace Util {

namespace {

// Guarded by the event lock. Never destroyed: a singleton may be made after the static objects of
// the process have gone.
std::vector<SingletonBase*>& singletons() {
    static auto* const made = new std::vector<SingletonBase*>;
    return *made;
}

}  // namespace

SingletonBase::~SingletonBase() = default;

void SingletonStorage::addSingleton(SingletonBase* singleton) {
    const EventLock lock;
    singletons().push_back(singleton);
}

void SingletonStorage::destroySingleton(SingletonBase* singleton) {
    const EventLock lock;
    std::vector<SingletonBase*>& made = singletons();
    const auto found = std::find(made.begin(), made.end(), singleton);
    if (found != made.end()) {
        made.erase(found);
        delete singleton;
    }
}

void SingletonStorage::destroyAll() {
    const EventLock lock;
    while (!singletons().empty()) {
        destroySingleton(singletons().back());
    }
}

void SingletonStorage::endEventsFirst() {
    kdEndEventsFirstKOR();
}

void SingletonStorage::endSingleton(SingletonBase* singleton, bool staysAtProcessEnd) {
    const KDint ended = kdEventsHaveEndedKOR();
    const bool lockIsLost = ended < 0;
    if (!lockIsLost && !(ended != 0 && staysAtProcessEnd)) {
        destroySingleton(singleton);
    }
}

}  // namespace Util
