#include "gateway/BodyPump.h"

#include <gtest/gtest.h>

#include <future>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace {

using Gateway::BodyPump;

void push(BodyPump& pump, const std::string& piece) {
    pump.push(piece.data(), piece.size());
}

/** A consumer that keeps every piece, but none before `let` has a value. */
class SlowConsumer {
  public:
    void operator()(const std::string& piece) {
        if (pieces.empty()) {
            begun.set_value();
            let.get_future().wait();
        }
        pieces.push_back(piece);
    }

    std::promise<void> let;
    /** Has a value when the first piece is there. */
    std::promise<void> begun;
    std::vector<std::string> pieces;
};

TEST(BodyPump, HandsOnThePiecesInOrder) {
    std::string taken;
    BodyPump pump([&taken](const std::string& piece) { taken += "[" + piece + "]"; });
    std::string expected;
    for (int i = 0; i < 1000; ++i) {
        push(pump, std::to_string(i));
        expected += "[" + std::to_string(i) + "]";
    }
    pump.finish();
    EXPECT_EQ(expected, taken);
}

TEST(BodyPump, TakesPiecesWhileTheConsumerIsBusy) {
    SlowConsumer consumer;
    BodyPump pump([&consumer](const std::string& piece) { consumer(piece); });
    push(pump, "a");
    consumer.begun.get_future().wait();
    push(pump, "b");
    push(pump, "c");
    EXPECT_TRUE(consumer.pieces.empty());
    consumer.let.set_value();
    pump.finish();
    EXPECT_EQ((std::vector<std::string>{"a", "b", "c"}), consumer.pieces);
}

TEST(BodyPump, WaitsForTheConsumerWhenThereIsNoRoom) {
    SlowConsumer consumer;
    BodyPump pump([&consumer](const std::string& piece) { consumer(piece); }, 100);
    push(pump, "a");
    consumer.begun.get_future().wait();
    push(pump, std::string(100, 'b'));
    std::promise<void> pushed;
    std::future<void> isPushed = pushed.get_future();
    std::thread pusher([&pump, &pushed] {
        push(pump, "c");
        pushed.set_value();
    });
    EXPECT_EQ(std::future_status::timeout, isPushed.wait_for(std::chrono::milliseconds(50)));
    consumer.let.set_value();
    pusher.join();
    pump.finish();
    EXPECT_EQ((std::vector<std::string>{"a", std::string(100, 'b'), "c"}), consumer.pieces);
}

TEST(BodyPump, WaitsForTheRunningCallWhenItIsDestroyed) {
    SlowConsumer consumer;
    {
        BodyPump pump([&consumer](const std::string& piece) { consumer(piece); });
        push(pump, "a");
        consumer.begun.get_future().wait();
        consumer.let.set_value();
    }
    EXPECT_EQ(std::vector<std::string>{"a"}, consumer.pieces);
}

TEST(BodyPump, PassesOnWhatTheConsumerThrows) {
    BodyPump pump([](const std::string& piece) {
        if (piece == "b") {
            throw std::runtime_error("no more");
        }
    });
    push(pump, "a");
    pump.finish();
    push(pump, "b");
    EXPECT_THROW(pump.finish(), std::runtime_error);
    EXPECT_THROW(push(pump, "c"), std::runtime_error);
}

}  // namespace
