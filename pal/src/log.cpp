#include <clocale>
#include <cstdio>
#include <memory>
#include <mutex>
#include <new>

#include "immortal.h"
#include "pal/kd_log.h"

namespace {

constexpr std::size_t SHORT_MESSAGE = 512;

struct LogSink {
    std::mutex mutex;
    KDLogSinkFuncKOR* func = nullptr;
    void* user = nullptr;
};

thread_local bool insideSink = false;

LogSink& logSink() {
    static korvel_pal::Immortal<LogSink> sink;
    return sink.get();
}

class InsideSink {
  public:
    InsideSink() { insideSink = true; }
    ~InsideSink() { insideSink = false; }
    InsideSink(const InsideSink&) = delete;
    InsideSink& operator=(const InsideSink&) = delete;
};

// One call, so that lines of several threads do not mix; without memory of our own.
void writeToStandardError(const char* message) {
    std::fprintf(stderr, "%s\n", message);
}

/** Formats as in the "C" locale, in whichever the host application has set. */
int __attribute__((format(printf, 3, 0)))
formatText(char* buffer, std::size_t size, const char* format, va_list args) {
    static const locale_t plain = newlocale(LC_ALL_MASK, "C", locale_t{});
    const locale_t before = uselocale(plain);
    // The analyzer loses the callers' va_start on its way here.
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized)
    const int length = std::vsnprintf(buffer, size, format, args);
    uselocale(before);
    return length;
}

}  // namespace

void kdLogMessage(const char* string) {
    const char* const message = string != nullptr ? string : "";
    if (insideSink) {
        writeToStandardError(message);  // a sink that logs must not call itself
        return;
    }
    LogSink& sink = logSink();
    const std::lock_guard<std::mutex> lock(sink.mutex);
    if (sink.func == nullptr) {
        writeToStandardError(message);
        return;
    }
    const InsideSink inside;
    try {
        sink.func(message, sink.user);
    } catch (...) {
        writeToStandardError(message);  // logging never fails, whatever the sink lacks
    }
}

void kdLogFormatMessage(const char* format, ...) {
    va_list args;
    va_start(args, format);
    kdLogFormatMessageVargs(format, args);
    va_end(args);
}

void kdLogFormatMessageVargs(const char* format, va_list args) {
    if (format == nullptr) {
        kdLogMessage(nullptr);
        return;
    }
    char buffer[SHORT_MESSAGE];
    va_list again;
    va_copy(again, args);
    const int length = formatText(buffer, sizeof buffer, format, args);
    if (length < 0) {
        kdLogMessage(format);  // cannot be formatted; better than nothing
    } else if (static_cast<std::size_t>(length) < sizeof buffer) {
        kdLogMessage(buffer);
    } else {
        const std::size_t size = static_cast<std::size_t>(length) + 1;
        const std::unique_ptr<char[]> longBuffer(new (std::nothrow) char[size]);
        if (longBuffer != nullptr) {
            formatText(longBuffer.get(), size, format, again);
        }
        kdLogMessage(longBuffer != nullptr ? longBuffer.get() : buffer);
    }
    va_end(again);
}

void kdSetLogSinkKOR(KDLogSinkFuncKOR* func, void* user) {
    LogSink& sink = logSink();
    // The thread that is inside the sink holds the mutex already.
    const std::unique_lock<std::mutex> lock =
        insideSink ? std::unique_lock<std::mutex>() : std::unique_lock<std::mutex>(sink.mutex);
    sink.func = func;
    sink.user = user;
}

KDint kdSprintf_s(char* buf, KDsize bufsize, const char* format, ...) {
    if (buf == nullptr || bufsize == 0) {
        return -1;
    }
    buf[0] = '\0';
    if (format == nullptr) {
        return -1;
    }
    va_list args;
    va_start(args, format);
    const int length = formatText(buf, bufsize, format, args);
    va_end(args);
    if (length < 0) {
        buf[0] = '\0';
        return -1;
    }
    return static_cast<KDsize>(length) < bufsize ? length : static_cast<KDint>(bufsize - 1);
}
