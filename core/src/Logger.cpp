#include "core/Logger.h"

#include <atomic>
#include <cstdarg>

#include "pal/kd_log.h"

namespace {

std::atomic<int> loggerLevel{Logger::LEVEL_DFLT};

}  // namespace

void Logger::log(int level, const char* format, ...) {
    if (level > loggerLevel) {
        return;
    }
    va_list args;
    va_start(args, format);
    kdLogFormatMessageVargs(format, args);
    va_end(args);
}

void Logger::setLevel(int level) {
    loggerLevel = level;
}

int Logger::getLevel() {
    return loggerLevel;
}
