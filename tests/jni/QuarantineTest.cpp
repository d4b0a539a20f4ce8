#include "platforms/android/jni/Quarantine.h"

#include <gtest/gtest.h>

#include <set>

namespace {

using Jni::Quarantine;

TEST(Quarantine, GivesNoAddressOutAgainSoon) {
    const std::size_t sizeInBytes = 48;
    std::set<void*> freed;
    for (std::size_t count = 0; count < Quarantine::BLOCKS_KEPT; ++count) {
        void* const block = Quarantine::allocate(sizeInBytes);
        EXPECT_TRUE(freed.insert(block).second);
        Quarantine::free(block);
    }
}

TEST(Quarantine, TakesNothing) {
    Quarantine::free(nullptr);
    void* const block = Quarantine::allocate(1);
    EXPECT_NE(block, nullptr);
    Quarantine::free(block);
}

}  // namespace
