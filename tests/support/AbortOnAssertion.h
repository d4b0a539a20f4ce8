/**
 * @file
 * Ends the process at a broken invariant.
 */
#pragma once

#include <cstdio>
#include <cstdlib>

#include "pal/kd_assert.h"

namespace TestSupport {

/**
 * Installs a handler that writes the report to standard error and aborts, so that no test or fuzz
 * target passes over an assertion that it does not expect. Every such program calls this first;
 * `AssertCapture` returns to it.
 */
inline void abortOnAssertion() {
    kdSetAssertionHandlerKOR(
        [](const char* condition, const char* path, KDint line, void* /*user*/) {
            std::fprintf(stderr, "assertion failed: %s (%s:%d)\n", condition, path, line);
            std::abort();
        },
        nullptr);
}

}  // namespace TestSupport
