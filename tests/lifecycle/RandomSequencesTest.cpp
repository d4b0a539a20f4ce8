#include <gtest/gtest.h>

#include "Runner.h"

namespace {

const std::uint64_t SEQUENCES_PER_PART = 2500;

/** In parts, so that several run at a time. */
class RandomSequencesTest : public ::testing::TestWithParam<int> {};

TEST_P(RandomSequencesTest, KeepTheContract) {
    const auto part = static_cast<std::uint64_t>(GetParam());
    const std::string found = Lifecycle::run({1 + SEQUENCES_PER_PART * part, SEQUENCES_PER_PART});
    EXPECT_TRUE(found.empty()) << found;
}

INSTANTIATE_TEST_SUITE_P(Seeds, RandomSequencesTest, ::testing::Range(0, 8));

}  // namespace
