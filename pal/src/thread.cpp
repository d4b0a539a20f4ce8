#include <mutex>
#include <new>

#include "pal/kd_assert.h"
#include "pal/kd_thread.h"

struct KDThreadMutex {
    std::mutex mutex;
};

KDThreadMutex* kdThreadMutexCreate(const void* mutexattr) {
    return KOR_ASSERT(mutexattr == nullptr) ? new (std::nothrow) KDThreadMutex : nullptr;
}

KDint kdThreadMutexFree(KDThreadMutex* mutex) {
    delete mutex;
    return 0;
}

KDint kdThreadMutexLock(KDThreadMutex* mutex) {
    if (mutex == nullptr) {
        return -1;
    }
    mutex->mutex.lock();
    return 0;
}

KDint kdThreadMutexUnlock(KDThreadMutex* mutex) {
    if (mutex == nullptr) {
        return -1;
    }
    mutex->mutex.unlock();
    return 0;
}
