#include <boost/assert.hpp>
#include <cstdlib>

#include "core/Export.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace {

// Boost's code goes on with what the check was there to prevent, such as a call through a null
// pointer. So a handler may end the call by an exception, but must not simply return.
[[noreturn]] void report(const char* condition, const char* file, long line) {
    kdHandleAssertionInFileKOR(condition, file, static_cast<KDint>(line));
    kdLogFormatMessage("cannot go on after assertion \"%s\"", condition);
    std::abort();
}

}  // namespace

namespace boost {

KORVEL_CORE_API void assertion_failed(const char* expr, const char* /*function*/, const char* file,
                                      long line) {
    report(expr, file, line);
}

KORVEL_CORE_API void assertion_failed_msg(const char* expr, const char* /*msg*/,
                                          const char* /*function*/, const char* file, long line) {
    report(expr, file, line);
}

}  // namespace boost
