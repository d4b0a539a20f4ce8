#include "talvox/Log.h"

#include <cstdarg>

#include "pal/kd_log.h"
#include "talvox/Talvox.h"

bool tvIsLogged(int level) {
    using ::Talvox::Settings;
    const auto settings = Talvox::Talvox::getInstance().getTalvoxSettings();
    return level <= settings->getInt(Settings::SKS_VERBOSE_LEVEL);
}

void tvLogFormatMessage(int level, const char* format, ...) {
    if (!tvIsLogged(level)) {
        return;
    }
    va_list args;
    va_start(args, format);
    kdLogFormatMessageVargs(format, args);
    va_end(args);
}
