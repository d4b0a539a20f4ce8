#include "core/util/Singleton.h"

#include <algorithm>
#include <vector>

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

}  // namespace Util
