#include "LogOutput.h"

#include <cstring>
#include <string>

#include "pal/kd.h"

namespace Cli {

LogOutput::LogOutput(std::ostream& output) : out(output) {
    kdSetLogSinkKOR(&LogOutput::receive, this);
}

LogOutput::~LogOutput() {
    kdSetLogSinkKOR(nullptr, nullptr);
}

void LogOutput::show(bool value) {
    const std::lock_guard<std::mutex> lock(mutex);
    shown = value;
}

void LogOutput::watchFor(const std::string& text) {
    const std::lock_guard<std::mutex> lock(mutex);
    watched = text;
    seenWatched = false;
}

bool LogOutput::hasSeenWatched() {
    const std::lock_guard<std::mutex> lock(mutex);
    return seenWatched;
}

void LogOutput::receive(const char* message, void* self) {
    auto& output = *static_cast<LogOutput*>(self);
    const std::lock_guard<std::mutex> lock(output.mutex);
    if (!output.watched.empty() && std::strstr(message, output.watched.c_str()) != nullptr) {
        output.seenWatched = true;
    }
    if (output.shown) {
        output.out << std::string("talvox: ") + message + '\n' << std::flush;
    }
}

}  // namespace Cli
