#pragma once

#include <string>

namespace Cli {

/** Where the probes go, and how. */
struct ProbeTarget {
    std::string url;             /**< of the gateway, without "/asrgw" */
    std::string certificateFile; /**< authorities to trust beside the system's */
    int timeoutMs = 0;           /**< longest wait without any progress */
};

}  // namespace Cli
