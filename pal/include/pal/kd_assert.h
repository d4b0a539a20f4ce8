/**
 * @file
 * Reporting of broken invariants.
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
 * The default handler logs "assertion failed: CONDITION (FILE:LINE)" and aborts the process. Where
 * an installed handler returns, the caller goes on.
 */
KD_API void kdHandleAssertion(const char* condition, const char* filename, KDint linenumber);

typedef void(KDAssertionHandlerFuncKOR)(const char* condition, const char* filename,
                                        KDint linenumber, void* user);

/** Replaces the assertion handler; null restores the default. The handler may throw in tests. */
KD_API void kdSetAssertionHandlerKOR(KDAssertionHandlerFuncKOR* handler, void* user);

/** As `kdHandleAssertion`, for `__FILE__`: removes the extension. Used by `KOR_ASSERT`. */
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

inline bool check(bool holds, const char* text, const char* file, int line) {
    if (!holds) {
        kdHandleAssertionInFileKOR(text, file, line);
    }
    return holds;
}

inline bool checkAt(bool holds, const char* text, const char* path, int line) {
    if (!holds) {
        kdHandleAssertion(text, path, line);
    }
    return holds;
}

}  // namespace korvel_pal_detail

#endif

#endif
