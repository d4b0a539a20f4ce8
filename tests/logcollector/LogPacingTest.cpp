#include "LogFixture.h"

using TestSupport::Answer;

namespace {

constexpr int64_t STEP_MS = 1000;
constexpr int64_t MINUTE_MS = 60000;
constexpr int64_t TIMER_MS = 20000;
const char* const ATTEMPT = "LogCollectorNetworkTask: request url is ";

/** How much an endpoint that does not work costs, by the platform clock. */
class LogPacingTest : public LogFixture {
  protected:
    LogPacingTest() { LogCollector::startSession("id"); }

    static void sendRecords(int count) {
        for (int i = 0; i < count; ++i) {
            LogCollector::logEvent("id", std::to_string(i), {});
        }
    }

    std::size_t countInLog(const std::string& part) const {
        std::size_t found = 0;
        for (const std::string& message : log.messages()) {
            found += message.find(part) != std::string::npos ? 1 : 0;
        }
        return found;
    }

    std::size_t attempts() const { return countInLog(ATTEMPT); }

    /** Waits until each attempt has come as far as `reached` counts, and none follows at once. */
    template <typename Reached>
    bool awaitAttempts(Reached reached) {
        for (int i = 0; i < 10000; ++i) {
            const std::size_t before = attempts();
            // What is reached only while settling may still be followed by an attempt.
            const bool allReached = reached() == before;
            settle();
            if (allReached && attempts() == before) {
                return true;
            }
        }
        return false;
    }

    template <typename Reached>
    void pass(int64_t milliseconds, Reached reached) {
        for (int64_t now = 0; now < milliseconds; now += STEP_MS) {
            ASSERT_TRUE(awaitAttempts(reached)) << now;
            advanceMs(STEP_MS);
        }
        ASSERT_TRUE(awaitAttempts(reached));
    }
};

TEST_F(LogPacingTest, AnEndpointThatRefusesConnectionsCosts40AttemptsAMinute) {
    const TestSupport::RefusingPort port;
    LogCollector::configure(UUID, port.getUrl());
    sendRecords(5);
    const auto failed = [this] { return countInLog(NETWORK_FAILURE); };
    pass(MINUTE_MS - STEP_MS, failed);
    EXPECT_EQ(39U, attempts());
    pass(STEP_MS, failed);
    EXPECT_EQ(41U, attempts());
    log.clear();
    pass(MINUTE_MS, failed);
    EXPECT_EQ(40U, attempts());
    EXPECT_EQ(5U, LogCollector::getPendingCount());
}

TEST_F(LogPacingTest, AnEndpointThatRejectsRecordsCosts39RequestsAMinute) {
    server.setDefaultAnswer(Answer::status(404));
    sendRecords(5);
    const auto failed = [this] { return log.count(FAILURE); };
    pass(MINUTE_MS, failed);
    log.clear();
    const std::size_t before = server.getRequestCount();
    pass(MINUTE_MS, failed);
    // Two every three seconds; the timer's tick, every 20 seconds, comes in the middle of a pause.
    EXPECT_EQ(39U, attempts());
    EXPECT_EQ(39U, server.getRequestCount() - before);
    EXPECT_EQ(1U, server.getConnectionCount());
    EXPECT_EQ(5U, LogCollector::getPendingCount());
}

TEST_F(LogPacingTest, AnEndpointThatNeverAnswersCostsTwoRequestsIn63Seconds) {
    server.setDefaultAnswer(Answer::never());
    sendRecords(5);
    const auto arrived = [this] { return server.getRequestCount(); };
    pass(62000, arrived);
    EXPECT_EQ(2U, attempts());
    pass(126000, arrived);
    EXPECT_EQ(6U, attempts());
}

TEST_F(LogPacingTest, RecordsThatArriveMeanwhileCostNothing) {
    server.setDefaultAnswer(Answer::status(204));
    const auto failed = [this] { return log.count(FAILURE); };
    for (int second = 0; second < 12; ++second) {
        sendRecords(50);
        pass(STEP_MS, failed);
    }
    // Two at the start and two every three seconds.
    EXPECT_LE(attempts(), 10U);
    EXPECT_EQ(600U, LogCollector::getPendingCount());
}

TEST_F(LogPacingTest, OneRecordThatIsRejectedDoesNotHoldUpTheOthers) {
    server.script({Answer::status(414)});
    LogCollector::logEvent("id", "bad", {});
    for (int i = 0; i < 20; ++i) {
        sendRecords(1);
    }
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(22U, server.getRequestCount());
}

struct Senseless {
    const char* what;
    std::string uuid;
    std::string url;
};

void PrintTo(const Senseless& value, std::ostream* out) {
    *out << value.what;
}

class LogSenselessTest : public LogPacingTest, public ::testing::WithParamInterface<Senseless> {};

TEST_P(LogSenselessTest, IsAskedForOncePerTimerPeriodAndMendedAtOnce) {
    const std::string good = LogCollector::getUrl();
    LogCollector::configure(GetParam().uuid, GetParam().url);
    const auto failed = [this] { return log.count(FAILURE); };
    sendRecords(100);
    ASSERT_TRUE(log.waitFor(FAILURE));
    settle();
    sendRecords(100);
    settle();
    EXPECT_EQ(1U, failed());
    advanceMs(TIMER_MS - 1);
    settle();
    EXPECT_EQ(1U, failed());
    for (std::size_t tick = 2; tick < 5; ++tick) {
        advanceMs(tick == 2 ? 1 : TIMER_MS);
        ASSERT_TRUE(log.waitFor(FAILURE, tick));
        settle();
        sendRecords(1);
        settle();
        EXPECT_EQ(tick, failed());
    }
    EXPECT_EQ(203U, LogCollector::getPendingCount());
    EXPECT_EQ(0U, server.getRequestCount());

    LogCollector::configure(UUID, good);
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(203U, server.getRequestCount());
}

INSTANTIATE_TEST_SUITE_P(
    AddressesAndUuids, LogSenselessTest,
    ::testing::Values(Senseless{"NoUrl", UUID, ""}, Senseless{"NoScheme", UUID, "nonsense"},
                      Senseless{"OtherScheme", UUID, "ftp://127.0.0.1/log"},
                      Senseless{"NoHost", UUID, "http://"},
                      Senseless{"NoSuchPort", UUID, "http://127.0.0.1:99999/log"},
                      Senseless{"BlankInUrl", UUID, "http://127.0.0.1/a log"},
                      Senseless{"FragmentInUrl", UUID, "http://127.0.0.1/log#here"},
                      Senseless{"LineFeedInUrl", UUID, "http://127.0.0.1/log\nX-Other: 1"},
                      Senseless{"BlankInUuid", "a b", "http://127.0.0.1/log"},
                      Senseless{"HeaderInUuid", "a HTTP/1.1\r\nX-Other: 1\r\n\r\n",
                                "http://127.0.0.1/log"},
                      Senseless{"ZeroInUuid", std::string("a\0b", 3), "http://127.0.0.1/log"},
                      Senseless{"FragmentInUuid", "a#b", "http://127.0.0.1/log"}),
    [](const ::testing::TestParamInfo<Senseless>& entry) { return entry.param.what; });

}  // namespace
