#include "VadPrinter.h"

namespace Cli {

std::string decisionText(const Talvox::VadBufferAnalysis& buffer) {
    std::string text;
    for (const bool decision : buffer.decisions) {
        text += decision ? '1' : '0';
    }
    return text;
}

}  // namespace Cli
