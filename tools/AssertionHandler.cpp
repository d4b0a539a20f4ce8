#include "tools/AssertionHandler.h"

#include <cstdio>
#include <cstdlib>

#include "pal/kd_assert.h"

namespace Tools {

namespace {

#ifdef NDEBUG
constexpr bool ABORTS = false;
#else
constexpr bool ABORTS = true;
#endif

void report(const char* condition, const char* file, KDint line, void* program) {
    std::fprintf(stderr, "%s: assertion failed: %s (%s:%d)\n", static_cast<const char*>(program),
                 condition, file, line);
    if (ABORTS) {
        std::abort();
    }
}

}  // namespace

void installAssertionHandler(const char* program) {
    kdSetAssertionHandlerKOR(&report, const_cast<char*>(program));
}

}  // namespace Tools
