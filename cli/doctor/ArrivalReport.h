#pragma once

#include <optional>
#include <string>

namespace Cli {

/** When the body of a request reached the gateway, by its own report (docs/PROTOCOL.md). */
struct ArrivalReport {
    /** @return nothing if the text is no such report of a body that arrived */
    static std::optional<ArrivalReport> read(const std::string& text);

    double pieces = 0;
    double firstMs = 0;
    double lastMs = 0;
    double gapMs = 0;
    double answerMs = 0;
};

}  // namespace Cli
