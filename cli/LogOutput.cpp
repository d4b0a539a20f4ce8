#include "LogOutput.h"

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

void LogOutput::receive(const char* message, void* self) {
    auto& output = *static_cast<LogOutput*>(self);
    const std::lock_guard<std::mutex> lock(output.mutex);
    if (output.shown) {
        output.out << std::string("talvox: ") + message + '\n' << std::flush;
    }
}

}  // namespace Cli
