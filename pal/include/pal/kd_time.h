/**
 * @file
 * The one clock of the system.
 *
 * `kdGetTimeUST`, `kdTime` and every timer read the same clock. It has two forms: the real one
 * (the default) and one that is moved by hand, for tests and for tools that run faster than real
 * time. Nothing else in the system asks the operating system for the time.
 */
#ifndef KORVEL_PAL_KD_TIME_H
#define KORVEL_PAL_KD_TIME_H

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/** Broken-down calendar time, with the conventions of C's `struct tm`. */
typedef struct KDTm {
    KDint tm_sec;  /**< 0 to 60 */
    KDint tm_min;  /**< 0 to 59 */
    KDint tm_hour; /**< 0 to 23 */
    KDint tm_mday; /**< 1 to 31 */
    KDint tm_mon;  /**< 0 (January) to 11 */
    KDint tm_year; /**< years since 1900 */
    KDint tm_wday; /**< 0 (Sunday) to 6 */
    KDint tm_yday; /**< 0 to 365 */
} KDTm;

/** Nanoseconds on the current clock. Never blocks. */
KD_API KDust kdGetTimeUST(void);

/**
 * Seconds since 1970 on the current clock; also stored in `*timep` unless that is null.
 * The hand-driven clock counts its calendar time from its own start value.
 */
KD_API KDtime kdTime(KDtime* timep);

/**
 * Splits `*timep` into UTC fields. Any 64-bit value is accepted: where the year does not fit, all
 * fields are those of the nearest representable time.
 * @return `result`, or null when an argument is null.
 */
KD_API KDTm* kdGmtime_r(const KDtime* timep, KDTm* result);

/** As `kdGmtime_r`, in the process's local time zone. */
KD_API KDTm* kdLocaltime_r(const KDtime* timep, KDTm* result);

/**
 * Switches to the hand-driven clock, which stands still at `startUST` nanoseconds until
 * `kdAdvanceClockKOR` moves it. Timers that run keep the time that was left to them.
 */
KD_API void kdUseManualClockKOR(KDust startUST);

/** Switches back to the real clock. Timers that run keep the time that was left to them. */
KD_API void kdUseRealClockKOR(void);

/**
 * Moves the hand-driven clock forward by `nanoseconds` (0 or more).
 *
 * Timers that become due on the way fire on the calling thread, under the event lock, in the order
 * of their due times (of their start, where those are equal), each while the clock shows exactly
 * its due time. A timer that a callback starts fires within the same call when it becomes due
 * before the end. Returns when the clock shows the new time. Does nothing on the real clock.
 * May be called from inside a callback.
 */
KD_API void kdAdvanceClockKOR(KDint64 nanoseconds);

KD_EXTERN_C_END

#endif
