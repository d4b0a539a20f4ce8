#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <condition_variable>
#include <mutex>
#include <string>
#include <vector>

#include "core/Logger.h"
#include "core/network/NetworkTaskHolder.h"
#include "core/util/Singleton.h"
#include "core/util/UrlCoder.h"
#include "logcollector/LogCollector.h"
#include "pal/kd.h"
#include "support/LogCapture.h"
#include "support/ScriptedHttpServer.h"

const char* const FAILURE = "LogSender: a dummy record send request fails";
const char* const NETWORK_FAILURE = "Network: a request failed: ";
const char* const UUID = "0123456789abcdef0123456789abcdef";
const char* const MESSAGE_KEY = "&logmessage=";

/** The record that a request carries, decoded; empty without one. */
inline std::string recordIn(const std::string& address) {
    const std::size_t key = address.find(MESSAGE_KEY);
    if (key == std::string::npos) {
        return std::string();
    }
    const std::size_t start = key + std::string(MESSAGE_KEY).size();
    return Util::UrlCoder::urlDecodeString(address.substr(start, address.find(' ', start) - start));
}

/** Something that other threads announce and a test waits for. */
class Signal {
  public:
    void raise() {
        const std::lock_guard<std::mutex> lock(mutex);
        ++count;
        changed.notify_all();
    }

    bool waitFor(std::size_t times,
                 std::chrono::milliseconds timeout = TestSupport::SERVER_WAIT_DFLT) {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, timeout, [this, times] { return count >= times; });
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    std::size_t count = 0;
};

/** Passes through the network thread and ends on the event thread; nothing is sent. */
class BarrierTask : public Network::NetworkTask {
  public:
    explicit BarrierTask(Signal& signal) : passed(signal) {}

    bool isReadyToPerform() const override { return false; }
    boost::shared_ptr<Network::HttpRequest> issueRequest() const override { return nullptr; }
    void onResponseRecieved(boost::shared_ptr<Network::HttpResponse>) override {}
    void onBytesReceived(const std::vector<unsigned char>&) override {}
    void onFinished(int) override { passed.raise(); }

  private:
    Signal& passed;
};

/** An endpoint, a collector that is to use it, and a clock that only the test moves. */
class LogFixture : public ::testing::Test {
  protected:
    static constexpr int64_t START_UST = 951782400;  // as seconds: 29 February 2000

    LogFixture() {
        kdUseManualClockKOR(START_UST);
        Logger::setLevel(Logger::PROGRESS);
        LogCollector::configure(UUID, server.getUrl() + "/log");
        LogCollector::setLoggingEnabled(true);
        LogCollector::setDeliveredCallback([this] { delivered.raise(); });
    }
    ~LogFixture() override {
        Util::SingletonStorage::destroyAll();
        kdDrainEventsKOR();
        kdUseRealClockKOR();
        Logger::setLevel(Logger::LEVEL_DFLT);
    }

    static void advanceMs(int64_t milliseconds) { kdAdvanceClockKOR(milliseconds * 1000000); }

    /**
     * Waits until the network thread and the event thread have done what they know of, and what
     * the event thread gave the network thread to do then.
     */
    static void settle() {
        for (int round = 0; round < 2; ++round) {
            Signal passed;
            Network::NetworkTaskHolder holder;
            holder.submitNoRetries(boost::make_shared<BarrierTask>(passed));
            ASSERT_TRUE(passed.waitFor(1));
        }
    }

    /** Path and query of a request. */
    std::string addressOf(std::size_t request) const {
        const std::string line = server.getRequest(request).line();
        return line.substr(4, line.rfind(' ') - 4);  // between the method and the protocol
    }

    std::string recordOf(std::size_t request) const { return recordIn(addressOf(request)); }

    /** The records of all requests so far. */
    std::vector<std::string> records() const {
        std::vector<std::string> all;
        for (std::size_t i = 0; i < server.getRequestCount(); ++i) {
            all.push_back(recordOf(i));
        }
        return all;
    }

    TestSupport::LogCapture log;
    Signal delivered;
    TestSupport::ScriptedHttpServer server;
};
