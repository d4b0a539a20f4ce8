// Takes the engine's log, here to number its lines.
// usage: log_sink
#include <pal/kd_log.h>
#include <talvox/Settings.h>

#include <iostream>

namespace {

struct Sink {
    int lines = 0;
};

/** Called on the thread that logs, one message at a time. Must not log. */
void write(const char* message, void* user) {
    std::cout << ++static_cast<Sink*>(user)->lines << ": " << message << std::endl;
}

}  // namespace

int main() {
    Sink sink;
    kdSetLogSinkKOR(write, &sink);

    // Something to log: validation names each bad value and repairs it.
    Talvox::Settings settings;
    settings.putInt(Talvox::Settings::SKS_SAMPLE_RATE, 1000);
    settings.putString(Talvox::Settings::RS_MODEL, "poetry");
    settings.validate();

    // The sink must be gone before its data.
    kdSetLogSinkKOR(nullptr, nullptr);
    return sink.lines > 0 ? 0 : 1;
}
