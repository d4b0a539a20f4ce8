#include "Version.h"

#include "talvox/Talvox.h"

namespace Cli {

std::string versionText() {
    return "talvox " + Talvox::Talvox::VERSION + " (build " TALVOX_BUILD_ID ")";
}

}  // namespace Cli
