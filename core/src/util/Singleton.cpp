// Singletons end in the reverse order of their making, whatever the order of static objects is: the
// list has them by age, and `EndOfLibrary`, a static object that is made with a class's first
// instance, deletes that instance from it. Before the first of them goes, the platform layer ends
// all deliveries (`endEventsFirst` has registered that at the process's exit), so that no callback
// meets an engine that is half gone. All of this happens under the event lock. If a callback hangs
// and keeps the lock for good, nothing is deleted: a leak at exit is harmless, a use after delete
// is not.
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
