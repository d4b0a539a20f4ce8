#include "gateway/DecoderPool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <thread>

#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Gateway::DecoderPool;
using Gateway::SpeechModel;

constexpr unsigned LONG_MS = 60000;

void awaitWaiting(const DecoderPool& pool, std::size_t count) {
    while (pool.getWaiting() < count) {
        std::this_thread::yield();
    }
}

}  // namespace

TEST(DecoderPool, LendsNoMoreThanItMayLoad) {
    DecoderPool pool(SpeechModel(), 2, 0);
    DecoderPool::Lease first = pool.tryAcquire();
    DecoderPool::Lease second = pool.tryAcquire();
    ASSERT_TRUE(first);
    ASSERT_TRUE(second);
    EXPECT_FALSE(pool.tryAcquire());
    EXPECT_FALSE(pool.acquire());
    const Gateway::SpeechDecoder* given = first.get();
    first.reset();
    EXPECT_EQ(given, pool.tryAcquire().get());
}

TEST(DecoderPool, ServesTheLongestWaitingFirst) {
    DecoderPool pool(SpeechModel(), 1, LONG_MS);
    DecoderPool::Lease lease = pool.tryAcquire();
    std::atomic<int> order{0};
    const auto wait = [&] {
        const DecoderPool::Lease got = pool.acquire();
        EXPECT_TRUE(got);
        return ++order;
    };
    std::future<int> first = std::async(std::launch::async, wait);
    awaitWaiting(pool, 1);
    std::future<int> second = std::async(std::launch::async, wait);
    awaitWaiting(pool, 2);
    lease.reset();
    EXPECT_EQ(1, first.get());
    EXPECT_EQ(2, second.get());
}

TEST(DecoderPool, LetsNobodyPassThoseWhoWait) {
    DecoderPool pool(SpeechModel(), 1, LONG_MS);
    DecoderPool::Lease lease = pool.tryAcquire();
    std::promise<void> served;
    std::promise<void> done;
    std::thread waiting([&] {
        const DecoderPool::Lease got = pool.acquire();
        served.set_value();
        done.get_future().wait();
    });
    awaitWaiting(pool, 1);
    lease.reset();
    // Whether the waiting thread has woken up or not, the decoder is its own.
    EXPECT_FALSE(pool.tryAcquire());
    served.get_future().wait();
    EXPECT_FALSE(pool.tryAcquire());
    done.set_value();
    waiting.join();
    EXPECT_TRUE(pool.tryAcquire());
}

TEST(DecoderPool, EndsAllWaitingWhenItIsClosed) {
    DecoderPool pool(SpeechModel(), 1, LONG_MS);
    DecoderPool::Lease lease = pool.tryAcquire();
    std::future<bool> waiting =
        std::async(std::launch::async, [&] { return pool.acquire() != nullptr; });
    awaitWaiting(pool, 1);
    EXPECT_FALSE(pool.isClosed());
    pool.close();
    EXPECT_FALSE(waiting.get());
    EXPECT_TRUE(pool.isClosed());
    lease.reset();
    EXPECT_FALSE(pool.tryAcquire());
    EXPECT_FALSE(pool.acquire());
}

TEST(DecoderPool, ReportsAModelThatCannotBeLoaded) {
    const TestSupport::ScratchDirectory directory;
    SpeechModel model;
    model.acousticDir = directory.path("nothing");
    EXPECT_EQ("cannot read the model's file " + directory.path("nothing") + "/mdef",
              model.findProblem());
    const TestSupport::LogCapture log;
    DecoderPool pool(model, 1, 0);
    EXPECT_FALSE(pool.load());
    EXPECT_TRUE(log.contains("the decoder cannot load its model"));
    EXPECT_FALSE(pool.acquire());
}

TEST(SpeechModel, IsForOneLanguage) {
    const SpeechModel model;
    EXPECT_EQ("", model.findProblem());
    for (const char* tag : {"en", "en-US", "en_gb", "EN-us"}) {
        EXPECT_TRUE(model.speaks(tag)) << tag;
    }
    for (const char* tag : {"", " ", "e", "eng", "ru-RU", "den-US", "-", "en.US"}) {
        EXPECT_FALSE(model.speaks(tag)) << tag;
    }
}

TEST(SpeechModel, MayBeForOneCountry) {
    SpeechModel model;
    model.language = "en_US";
    for (const char* tag : {"en-US", "EN_us", "en-us-x-shouted"}) {
        EXPECT_TRUE(model.speaks(tag)) << tag;
    }
    for (const char* tag : {"en", "en-GB", "en-USA", "", "en-"}) {
        EXPECT_FALSE(model.speaks(tag)) << tag;
    }
}
