/**
 * @file
 * The event thread, the event lock, events, timers and background work.
 *
 * One thread delivers everything that happens asynchronously: timers, posted functions and the
 * completions of background work. It starts on first use, or by `kdStartEventsKOR`, which says
 * whether it could. Every delivery runs under one recursive lock, the event lock. Code that is
 * called by the application takes the same lock for the length of the call; so all that runs under
 * it is serialised, and whoever holds it may cancel a timer or background work and be sure that its
 * callback does not run any more.
 *
 * A callback may do: start, cancel and free timers (its own included), post, queue work, call any
 * function of this layer. It must not block. An exception that leaves it goes no further: it is
 * reported by `kdReportExceptionKOR`, and the next callback runs.
 *
 * When the process ends, deliveries end first: what existed when the event thread was started, or
 * at the latest call of `kdEndEventsFirstKOR`, still exists when the last callback returns. A
 * callback that runs is waited for (two seconds at most). Calls that come later are harmless and
 * have no effect beyond the handles that they return. The library stays in the process once it is
 * loaded: its threads must never lose the code that they run.
 */
#ifndef KORVEL_PAL_KD_EVENT_H
#define KORVEL_PAL_KD_EVENT_H

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/** Event types. */
#define KD_EVENT_TIMER 42
#define KD_EVENT_EXCEPTION_KOR 1001 /**< see `kdReportExceptionKOR` */

/** Timer types of `kdSetTimer`. */
#define KD_TIMER_ONESHOT 61
#define KD_TIMER_PERIODIC_AVERAGE 62 /**< keeps the average period: a late tick is caught up */
#define KD_TIMER_PERIODIC_MINIMUM 63 /**< at least one period between two ticks */

/** A running timer; made by `kdSetTimer`. */
typedef struct KDTimer KDTimer;

/** What a callback is told. Valid during the callback only. */
typedef struct KDEvent {
    KDust timestamp;  /**< the clock at delivery; for a timer, its due time */
    KDint type;       /**< an event type */
    void* userptr;    /**< the user pointer given when the event's source was made */
    KDTimer* timer;   /**< the timer that fired; null for other events */
    const char* text; /**< of an exception, what it says; null for other events */
} KDEvent;

/** Receives events; see `kdInstallCallback`. */
typedef void(KDCallbackFunc)(const KDEvent* event);

/**
 * Routes events of type `eventtype` that carry `eventuserptr` to `func`, replacing an earlier
 * registration for the same pair. With a null `func` the registration is removed.
 * @return 0, or -1 when the type is not known, or when there is no memory for a new registration.
 */
KD_API KDint kdInstallCallback(KDCallbackFunc* func, KDint eventtype, void* eventuserptr);

/**
 * Starts a timer whose `KD_EVENT_TIMER` events carry `eventuserptr`.
 * @param intervalNs  time to the first and between further events in nanoseconds; values below 1
 *                    count as 1
 * @param periodic    one of the `KD_TIMER_` types
 * @return the timer, to be given back with `kdCancelTimer` also after a one-shot has fired; null
 *         when the type is not known, when there is no memory, or when the event thread, which
 *         fires it, does not run and cannot start.
 */
KD_API KDTimer* kdSetTimer(KDint64 intervalNs, KDint periodic, void* eventuserptr);

/**
 * Ends and frees a timer. Under the event lock, none of its events is delivered afterwards.
 * @return 0, or -1 when `timer` is null or is not a live timer (nothing is touched then).
 */
KD_API KDint kdCancelTimer(KDTimer* timer);

/** Takes the event lock; the same thread may take it repeatedly. */
KD_API void kdEventLockKOR(void);

/** Releases the event lock once. Asserts, and does nothing, when the thread does not hold it. */
KD_API void kdEventUnlockKOR(void);

/** 1 when the calling thread holds the event lock, else 0. */
KD_API KDint kdHoldsEventLockKOR(void);

/**
 * Makes sure that the event thread and one worker run. After a success posts, timers and background
 * work fail for want of memory only. A failure is logged and leaves nothing behind; the next call,
 * or the next use, tries again. Any thread.
 * @return 0, or -1 when the system has no thread or memory for them now
 */
KD_API KDint kdStartEventsKOR(void);

/**
 * Runs `func(user)` on the event thread under the event lock, after everything posted before.
 * Never blocks. Functions still waiting when the process ends are dropped. Asserts when `func` is
 * null.
 * @return 0, or -1 when `func` will not run, because it is null, because there is no memory, or
 *         because the event thread does not run and cannot start
 */
KD_API KDint kdPostKOR(void (*func)(void* user), void* user);

/**
 * Reports an exception that ended a callback, for threads that catch what would leave their
 * outermost function. Logs it and delivers, on this thread and under the event lock, one
 * `KD_EVENT_EXCEPTION_KOR` to each registration for that type, so that the owner of what was
 * interrupted can end it. The layer's own threads do so for the callbacks that they run.
 * @param what the exception's text; null when it has none
 */
KD_API void kdReportExceptionKOR(const char* what);

/**
 * Returns once everything that was posted before the call has run, and any callback that ran at the
 * time of the call has returned. Does not wait for timers or for background work. Must not be
 * called with the event lock held, hence not from a callback.
 * @return 0, or -1 at once when the lock is held or the event thread has been stopped.
 */
KD_API KDint kdDrainEventsKOR(void);

/**
 * At the end of the process, deliveries are to end before the static objects that exist by now are
 * destroyed. For whoever has static objects that callbacks use; cheap, but not to be called over
 * and over. Any thread.
 */
KD_API void kdEndEventsFirstKOR(void);

/**
 * Whether the process ends and nothing is delivered any more. Under the event lock the answer holds
 * until the lock is released.
 * @return 0 before the end; 1 after it; -1 after it, when a callback blocks for ever and was left
 *         behind: the event lock may never be had again then
 */
KD_API KDint kdEventsHaveEndedKOR(void);

/** Background work in flight; see `kdQueueWorkKOR`. */
typedef struct KDWork KDWork;

/**
 * Runs `work(user)` on a worker thread without any lock, then `done(user)` (unless null) on the
 * event thread under the event lock. Work begins in the order of queueing, on up to four workers;
 * where the system has no threads for all of them, on fewer.
 * `work` may block, but must come to an end: the process cannot end before. It must not end the
 * process itself.
 * @return a handle that is valid until `done` is called or the work has been cancelled; null when
 *         `work` is null, which asserts, when there is no memory, or when the event thread does not
 *         run and cannot start
 */
KD_API KDWork* kdQueueWorkKOR(void (*work)(void* user), void (*done)(void* user), void* user);

/**
 * Under the event lock: guarantees that `done` is not called any more. The function `work` may be
 * running and then runs to its end; `release(user)` is called on the event thread, under the event
 * lock, once neither function can run any more, so that the owner can free `user`. Null as
 * `release` is accepted. Does nothing (`release` is not called) when the handle is not valid.
 */
KD_API void kdCancelWorkKOR(KDWork* work, void (*release)(void* user));

KD_EXTERN_C_END

#endif
