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

void LogOutput::receive(const char* message, void* self) {
    auto& output = *static_cast<LogOutput*>(self);
    if (output.shown) {
        const std::string line = std::string("talvox: ") + message + '\n';
        const std::lock_guard<std::mutex> lock(output.mutex);
        output.out << line << std::flush;
    }
}

}  // namespace Cli
