#include "PlatformLedger.h"

#include <dlfcn.h>

#include <chrono>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <new>
#include <utility>

#include "core/util/EventLock.h"
#include "pal/kd_event.h"

namespace Lifecycle {

namespace {

const std::chrono::seconds LONGEST_WAIT{30};

/** The function that the platform layer itself has under this name. */
template <typename Function>
Function* findReal(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

struct Ledger {
    std::mutex mutex;
    std::condition_variable idle;
    PlatformLedger counts;

    void change(long PlatformLedger::*count, long by) {
        const std::lock_guard<std::mutex> lock(mutex);
        counts.*count += by;
        if (counts.works == 0 && counts.posts == 0) {
            idle.notify_all();
        }
    }
};

/** Never destroyed: the libraries use it until the process has gone. */
Ledger& ledger() {
    static auto* const made = new Ledger;
    return *made;
}

/** Counts something down when it goes, also by an exception. */
class CountedDown {
  public:
    explicit CountedDown(long PlatformLedger::*what) : count(what) {}
    ~CountedDown() { ledger().change(count, -1); }
    CountedDown(const CountedDown&) = delete;
    CountedDown& operator=(const CountedDown&) = delete;

  private:
    long PlatformLedger::*count;
};

struct Post {
    void (*function)(void*);
    void* user;

    static void run(void* self) {
        const CountedDown whenOver(&PlatformLedger::posts);
        const std::unique_ptr<Post> post(static_cast<Post*>(self));
        post->function(post->user);
    }
};

struct Work {
    void (*work)(void*);
    void (*done)(void*);
    void (*release)(void*);
    void* user;
    KDWork* handle;

    static void run(void* self) { static_cast<Work*>(self)->work(static_cast<Work*>(self)->user); }

    static void finish(void* self) {
        static_cast<Work*>(self)->end(static_cast<Work*>(self)->done);
    }

    static void giveBack(void* self) {
        static_cast<Work*>(self)->end(static_cast<Work*>(self)->release);
    }

    /** Under the event lock, as every use of the table. */
    static std::map<KDWork*, Work*>& table() {
        static auto* const made = new std::map<KDWork*, Work*>;
        return *made;
    }

  private:
    void end(void (*call)(void*)) {
        const CountedDown whenOver(&PlatformLedger::works);
        const std::unique_ptr<Work> self(this);
        table().erase(handle);
        if (call != nullptr) {
            call(user);
        }
    }
};

}  // namespace

PlatformLedger PlatformLedger::now() {
    const std::lock_guard<std::mutex> lock(ledger().mutex);
    return ledger().counts;
}

bool PlatformLedger::waitUntilIdle() {
    std::unique_lock<std::mutex> lock(ledger().mutex);
    return ledger().idle.wait_for(lock, LONGEST_WAIT, [] {
        return ledger().counts.works == 0 && ledger().counts.posts == 0;
    });
}

}  // namespace Lifecycle

using Lifecycle::findReal;
using Lifecycle::ledger;
using Lifecycle::PlatformLedger;

KDTimer* kdSetTimer(KDint64 intervalNs, KDint periodic, void* eventuserptr) {
    static auto* const real = findReal<decltype(kdSetTimer)>("kdSetTimer");
    KDTimer* const timer = real(intervalNs, periodic, eventuserptr);
    ledger().change(&PlatformLedger::timers, timer != nullptr ? 1 : 0);
    return timer;
}

KDint kdCancelTimer(KDTimer* timer) {
    static auto* const real = findReal<decltype(kdCancelTimer)>("kdCancelTimer");
    const KDint result = real(timer);
    ledger().change(&PlatformLedger::timers, result == 0 ? -1 : 0);
    return result;
}

KDint kdInstallCallback(KDCallbackFunc* func, KDint eventtype, void* eventuserptr) {
    static auto* const real = findReal<decltype(kdInstallCallback)>("kdInstallCallback");
    const KDint result = real(func, eventtype, eventuserptr);
    const int change = func != nullptr ? 1 : -1;
    ledger().change(&PlatformLedger::callbacks, result == 0 ? change : 0);
    return result;
}

KDint kdPostKOR(void (*func)(void* user), void* user) {
    using Lifecycle::Post;
    static auto* const real = findReal<decltype(kdPostKOR)>("kdPostKOR");
    std::unique_ptr<Post> post(new (std::nothrow) Post{func, user});
    if (!post) {
        return -1;
    }
    ledger().change(&PlatformLedger::posts, 1);
    const KDint result = real(&Post::run, post.get());
    if (result == 0) {
        static_cast<void>(post.release());
    } else {
        ledger().change(&PlatformLedger::posts, -1);
    }
    return result;
}

KDWork* kdQueueWorkKOR(void (*work)(void* user), void (*done)(void* user), void* user) {
    using Lifecycle::Work;
    static auto* const real = findReal<decltype(kdQueueWorkKOR)>("kdQueueWorkKOR");
    const Util::EventLock lock;
    // What takes memory comes first: nothing may fail once the work is queued.
    std::map<KDWork*, Work*>& table = Work::table();
    std::unique_ptr<Work> counted =
        std::make_unique<Work>(Work{work, done, nullptr, user, nullptr});
    std::map<KDWork*, Work*> place{{nullptr, counted.get()}};
    KDWork* const handle = real(&Work::run, &Work::finish, counted.get());
    if (handle != nullptr) {
        ledger().change(&PlatformLedger::works, 1);
        counted->handle = handle;
        auto node = place.extract(place.begin());
        node.key() = handle;
        table.insert(std::move(node));
        static_cast<void>(counted.release());
    }
    return handle;
}

void kdCancelWorkKOR(KDWork* work, void (*release)(void* user)) {
    using Lifecycle::Work;
    static auto* const real = findReal<decltype(kdCancelWorkKOR)>("kdCancelWorkKOR");
    kdEventLockKOR();
    const auto found = Work::table().find(work);
    if (found != Work::table().end() && found->second->release == nullptr) {
        found->second->release = release;
        real(work, &Work::giveBack);
    }
    kdEventUnlockKOR();
}
