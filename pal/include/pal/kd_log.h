/**
 * @file
 * The platform log and safe formatting.
 */
#ifndef KORVEL_PAL_KD_LOG_H
#define KORVEL_PAL_KD_LOG_H

#include <stdarg.h>

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/** Writes one message of any length and any bytes, as it is. Null counts as an empty message. */
KD_API void kdLogMessage(const char* string);

/** Writes one printf-style message of any length. Numbers have a point in every locale. */
KD_API void kdLogFormatMessage(const char* format, ...) __attribute__((format(printf, 1, 2)));

/** As `kdLogFormatMessage`, with the arguments as a list. */
KD_API void kdLogFormatMessageVargs(const char* format, va_list args)
    __attribute__((format(printf, 1, 0)));

/**
 * Receives every log message. `message` ends with a zero byte, has no line feed added and is valid
 * during the call only. Called on the logging thread, one message at a time; it must not log (what
 * it logs all the same goes to standard error), and may only block as long as the application
 * accepts that its callers block.
 */
typedef void(KDLogSinkFuncKOR)(const char* message, void* user);

/**
 * Replaces the log sink; null restores the default, which writes lines to standard error. Once this
 * has returned, the former sink is not called any more.
 */
KD_API void kdSetLogSinkKOR(KDLogSinkFuncKOR* sink, void* user);

/**
 * As C's `snprintf` in the "C" locale, but never reports more than it wrote.
 * @return the number of characters written before the closing zero, or -1 when `buf` is null or
 *         `bufsize` is 0; a text that did not fit is cut.
 */
KD_API KDint kdSprintf_s(char* buf, KDsize bufsize, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

KD_EXTERN_C_END

#endif
