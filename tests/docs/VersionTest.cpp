// The version, which the build takes from the top-level CMakeLists.txt, where nothing passes it on.
#include <gmock/gmock.h>

#include <string>

#include "support/ScratchDirectory.h"

namespace {

using ::testing::HasSubstr;
using TestSupport::ScratchDirectory;

TEST(Version, OfTheChangesThatAreNotReleasedIsThatOfTheProject) {
    EXPECT_THAT(ScratchDirectory::read(std::string(PROJECT_DIR) + "/CHANGELOG.md"),
                HasSubstr("## Unreleased (version " PROJECT_VERSION ")\n"));
}

}  // namespace
