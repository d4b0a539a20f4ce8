/**
 * @file
 * Mutexes.
 */
#ifndef KORVEL_PAL_KD_THREAD_H
#define KORVEL_PAL_KD_THREAD_H

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/** A mutex; made by `kdThreadMutexCreate`. */
typedef struct KDThreadMutex KDThreadMutex;

/**
 * Makes a non-recursive mutex. @param mutexattr must be null.
 * @return the mutex, to be freed with `kdThreadMutexFree`; null when there is no memory.
 */
KD_API KDThreadMutex* kdThreadMutexCreate(const void* mutexattr);

/** Frees an unlocked mutex; null is accepted. @return 0. */
KD_API KDint kdThreadMutexFree(KDThreadMutex* mutex);

/** Locks; blocks until the mutex is free. @return 0, or -1 for null. */
KD_API KDint kdThreadMutexLock(KDThreadMutex* mutex);

/** Unlocks a mutex that the calling thread holds. @return 0, or -1 for null. */
KD_API KDint kdThreadMutexUnlock(KDThreadMutex* mutex);

KD_EXTERN_C_END

#endif
