#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "pal/kd_thread.h"
#include "support/AssertCapture.h"

namespace {

TEST(Mutex, ExcludesOtherThreads) {
    KDThreadMutex* const mutex = kdThreadMutexCreate(nullptr);
    ASSERT_NE(mutex, nullptr);
    int count = 0;
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([mutex, &count] {
            for (int j = 0; j < 1000; ++j) {
                EXPECT_EQ(kdThreadMutexLock(mutex), 0);
                ++count;
                EXPECT_EQ(kdThreadMutexUnlock(mutex), 0);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(count, 4000);
    EXPECT_EQ(kdThreadMutexFree(mutex), 0);
}

TEST(Mutex, AcceptsNull) {
    EXPECT_EQ(kdThreadMutexLock(nullptr), -1);
    EXPECT_EQ(kdThreadMutexUnlock(nullptr), -1);
    EXPECT_EQ(kdThreadMutexFree(nullptr), 0);
}

TEST(Mutex, HasNoAttributes) {
    const TestSupport::AssertCapture asserts;
    int attributes = 0;
    EXPECT_EQ(kdThreadMutexCreate(&attributes), nullptr);
    EXPECT_EQ(asserts.count(), 1u);
}

}  // namespace
