#include "PlatformLedger.h"

#include <dlfcn.h>

#include <chrono>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>

#include "pal/kd_event.h"

namespace Lifecycle {

namespace {

const std::chrono::seconds LONGEST_WAIT{30};

/** The function that the platform layer itself has under this name. */
template <typename Function>
Function* findReal(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

struct Books {
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
Books& books() {
    static auto* const made = new Books;
    return *made;
}

struct Post {
    void (*function)(void*);
    void* user;

    static void run(void* self) {
        const std::unique_ptr<Post> post(static_cast<Post*>(self));
        post->function(post->user);
        books().change(&PlatformLedger::posts, -1);
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
        const std::unique_ptr<Work> self(this);
        table().erase(handle);
        if (call != nullptr) {
            call(user);
        }
        books().change(&PlatformLedger::works, -1);
    }
};

}  // namespace

PlatformLedger PlatformLedger::now() {
    const std::lock_guard<std::mutex> lock(books().mutex);
    return books().counts;
}

bool PlatformLedger::waitUntilIdle() {
    std::unique_lock<std::mutex> lock(books().mutex);
    return books().idle.wait_for(
        lock, LONGEST_WAIT, [] { return books().counts.works == 0 && books().counts.posts == 0; });
}

}  // namespace Lifecycle

using Lifecycle::books;
using Lifecycle::findReal;
using Lifecycle::PlatformLedger;

KDTimer* kdSetTimer(KDint64 intervalNs, KDint periodic, void* eventuserptr) {
    static auto* const real = findReal<decltype(kdSetTimer)>("kdSetTimer");
    KDTimer* const timer = real(intervalNs, periodic, eventuserptr);
    books().change(&PlatformLedger::timers, timer != nullptr ? 1 : 0);
    return timer;
}

KDint kdCancelTimer(KDTimer* timer) {
    static auto* const real = findReal<decltype(kdCancelTimer)>("kdCancelTimer");
    const KDint result = real(timer);
    books().change(&PlatformLedger::timers, result == 0 ? -1 : 0);
    return result;
}

KDint kdInstallCallback(KDCallbackFunc* func, KDint eventtype, void* eventuserptr) {
    static auto* const real = findReal<decltype(kdInstallCallback)>("kdInstallCallback");
    books().change(&PlatformLedger::callbacks, func != nullptr ? 1 : -1);
    return real(func, eventtype, eventuserptr);
}

KDint kdPostKOR(void (*func)(void* user), void* user) {
    static auto* const real = findReal<decltype(kdPostKOR)>("kdPostKOR");
    books().change(&PlatformLedger::posts, 1);
    return real(&Lifecycle::Post::run, new Lifecycle::Post{func, user});
}

KDWork* kdQueueWorkKOR(void (*work)(void* user), void (*done)(void* user), void* user) {
    using Lifecycle::Work;
    static auto* const real = findReal<decltype(kdQueueWorkKOR)>("kdQueueWorkKOR");
    kdEventLockKOR();
    books().change(&PlatformLedger::works, 1);
    auto* const counted = new Work{work, done, nullptr, user, nullptr};
    counted->handle = real(&Work::run, &Work::finish, counted);
    Work::table()[counted->handle] = counted;
    KDWork* const handle = counted->handle;
    kdEventUnlockKOR();
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
