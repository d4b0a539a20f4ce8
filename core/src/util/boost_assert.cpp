#include <boost/assert.hpp>
#include <stdexcept>
#include <string>

#include "core/Export.h"
#include "pal/kd_assert.h"

namespace {

// Boost's code would go on with what the check is there to prevent: a call through a null pointer.
// So where the handler returns, an exception ends the call. This is the last resort for a mistake
// in the code: what an input can make null is checked before it is followed.
[[noreturn]] void report(const char* condition, const char* file, long line) {
    kdHandleAssertionInFileKOR(condition, file, static_cast<KDint>(line));
    throw std::logic_error(std::string("cannot go on after assertion \"") + condition + '"');
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
