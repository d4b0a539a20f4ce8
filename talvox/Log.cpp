#include "talvox/Log.h"

#include <cstdarg>

#include "pal/kd_log.h"
#include "talvox/Talvox.h"

void tvLogFormatMessage(int level, const char* format, ...) {
    using ::Talvox::Settings;
    const auto settings = Talvox::Talvox::getInstance().getTalvoxSettings();
    if (level > settings->getInt(Settings::SKS_VERBOSE_LEVEL)) {
        return;
    }
    va_list args;
    va_start(args, format);
    kdLogFormatMessageVargs(format, args);
    va_end(args);
}
