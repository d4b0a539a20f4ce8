/**
 * @file
 * Reporting of broken invariants.
 *
 * A report never ends the process: the libraries run inside an application that is not theirs. The
 * caller of each check goes on safely, whichever handler is installed. Tests, and an application
 * that prefers a core dump to a log line, install a handler that aborts.
 */
#ifndef KORVEL_PAL_KD_ASSERT_H
#define KORVEL_PAL_KD_ASSERT_H

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/**
 * Reports a broken invariant to the installed handler.
 * @param condition  text of the condition that does not hold
 * @param filename   source path relative to the project, without extension, such as "util/Bundle"
 * @param linenumber source line
 *
 * Counts the report, then calls the installed handler on this thread. Where the handler returns,
 * the caller goes on. Any thread, any number of threads at a time; never blocks on the event lock.
 */
KD_API void kdHandleAssertion(const char* condition, const char* filename, KDint linenumber);

/**
 * Receives each report. Called on the reporting thread, often under the event lock and possibly on
 * several threads at once. The texts are never null and are valid during the call only.
 *
 * May do: return, log, end the process. Must not do: block, call the engine. It may throw in tests.
 */
typedef void(KDAssertionHandlerFuncKOR)(const char* condition, const char* filename,
                                        KDint linenumber, void* user);

/**
 * Replaces the assertion handler; null restores the default. Any thread. A report that another
 * thread has begun may still reach the former handler.
 *
 * The default handler logs "assertion failed: CONDITION (FILE:LINE)" and returns. So that a check
 * in a loop does not flood the log, it logs the 1st, 10th, 100th, ... report of each site; from the
 * 10th on, ", N times" follows. Sites beyond the first 256 share one count.
 */
KD_API void kdSetAssertionHandlerKOR(KDAssertionHandlerFuncKOR* handler, void* user);

/**
 * The number of reports since the process began, whichever handler received them. Never decreases.
 * Any thread; never blocks. An application can compare two values, for example at the start and the
 * end of a session, to learn whether an invariant broke in between.
 */
KD_API KDint64 kdGetAssertionCountKOR(void);

/** As `kdHandleAssertion`, for `__FILE__`: removes the extension and any
 * leading "../". Used by `KOR_ASSERT`. */
KD_API void kdHandleAssertionInFileKOR(const char* condition, const char* file, KDint linenumber);

KD_EXTERN_C_END

#ifdef __cplusplus

/**
 * Checks an invariant; the value tells whether it holds, so that a caller can leave safely:
 * `if (!KOR_ASSERT(request)) return;`
 */
#define KOR_ASSERT(condition) \
    ::korvel_pal_detail::check(static_cast<bool>(condition), #condition, __FILE__, __LINE__)

/**
 * The same for a site whose text, path and line are documented and must not move with the code,
 * so that crash reports of different builds group together.
 */
#define KOR_ASSERT_AT(condition, text, path, line) \
    ::korvel_pal_detail::checkAt(static_cast<bool>(condition), text, path, line)

namespace korvel_pal_detail {

/** Reports where `holds` is false. @return `holds` */
inline bool check(bool holds, const char* text, const char* file, int line) {
    if (!holds) {
        kdHandleAssertionInFileKOR(text, file, line);
    }
    return holds;
}

/** Reports where `holds` is false. @return `holds` */
inline bool checkAt(bool holds, const char* text, const char* path, int line) {
    if (!holds) {
        kdHandleAssertion(text, path, line);
    }
    return holds;
}

}  // namespace korvel_pal_detail

#endif

#endif
