// The store in the hands of the collector: what is delivered, when and in which order.
#include <cstring>
#include <filesystem>

#include "LogFixture.h"
#include "StoreFolder.h"
#include "logcollector/impl/StoreFormat.h"

using LogCollector::LogStoreOptions;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::Answer;
using TestSupport::ScriptedHttpServer;

namespace {

constexpr int64_t NS_PER_S = 1000000000;
constexpr int64_t DAY_S = int64_t{24} * 60 * 60;
constexpr int64_t NOW_S = 20000 * DAY_S;
constexpr int64_t RETRY_MS = 3000;
constexpr int64_t BOUND = 8 << 10;
const char* const NOTICE = ";sessionId=logStore;type=error;name=logRecordsDropped;count=";

class StoredDeliveryTest : public LogFixture {
  protected:
    StoredDeliveryTest() {
        silent.setDefaultAnswer(Answer::never());
        restart();
    }

    /** As at the start of a process; the endpoint takes the first request and does not answer. */
    void restart() {
        Util::SingletonStorage::destroyAll();
        LogCollector::configure(UUID, silent.getUrl() + "/log");
        LogCollector::setLoggingEnabled(true);
        LogCollector::startSession("s");
        LogCollector::setDeliveredCallback([this] { delivered.raise(); });
    }

    static bool open(const LogStoreOptions& options) { return LogCollector::openStore(options); }
    bool open() const { return open(folder.options()); }

    void reopen(const LogStoreOptions& options) {
        restart();
        ASSERT_TRUE(open(options));
    }

    static void logEvents(int first, int last, const std::string& text = "") {
        for (int i = first; i <= last; ++i) {
            LogCollector::logEvent("s", std::to_string(i), {{"text", text}});
        }
    }

    /** Has the request that is not answered, and all that follow, go to the other endpoint. */
    void useServer() {
        const std::size_t before = server.getRequestCount();
        LogCollector::configure(UUID, server.getUrl() + "/log");
        silent.goAway();
        for (int i = 0; i < 100 && server.getRequestCount() == before; ++i) {
            advanceMs(RETRY_MS);
            server.waitForHead(before + 1, std::chrono::milliseconds(20));
        }
        silent.comeBack();
    }

    void deliver() {
        useServer();
        ASSERT_TRUE(delivered.waitFor(1));
    }

    /** What the endpoint got: the names of events, and of notices their counts in brackets. */
    std::vector<std::string> names() const {
        std::vector<std::string> all;
        for (const std::string& record : records()) {
            const std::size_t notice = record.find(NOTICE);
            if (notice != std::string::npos) {
                all.push_back("(" + record.substr(notice + std::strlen(NOTICE)) + ")");
            } else {
                const std::size_t name = record.find(";name=") + 6;
                all.push_back(record.substr(name, record.find(';', name) - name));
            }
        }
        return all;
    }

    static std::vector<std::string> numbers(int first, int last) {
        std::vector<std::string> all;
        for (int i = first; i <= last; ++i) {
            all.push_back(std::to_string(i));
        }
        return all;
    }

    /** Each record is either there or counted; one notice has the count. */
    void expectAllAreThereOrCounted(int logged) const {
        std::set<std::string> events;
        std::vector<std::string> notices;
        for (const std::string& name : names()) {
            if (name[0] == '(') {
                notices.push_back(name);
            } else {
                events.insert(name);
            }
        }
        const int lost = logged - static_cast<int>(events.size());
        EXPECT_GT(lost, logged / 2);
        EXPECT_THAT(notices, ElementsAre("(" + std::to_string(lost) + ")"));
        // All but the one that was on its way are the latest ones.
        for (const std::string& number : numbers(lost + 2, logged)) {
            EXPECT_EQ(1U, events.count(number)) << number;
        }
    }

    ScriptedHttpServer silent;
    StoreFolder folder;
};

TEST_F(StoredDeliveryTest, IsOffUntilItIsAskedFor) {
    logEvents(1, 3);
    EXPECT_FALSE(std::filesystem::exists(folder.path()));
    restart();
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

TEST_F(StoredDeliveryTest, DeliversFirstWhatEarlierProcessesLeft) {
    ASSERT_TRUE(open());
    logEvents(1, 3);
    reopen(folder.options());
    EXPECT_EQ(3U, LogCollector::getPendingCount());
    logEvents(4, 5);
    reopen(folder.options());
    logEvents(6, 6);
    deliver();
    EXPECT_EQ(numbers(1, 6), names());
    EXPECT_EQ("time=100-01-29 00:00:00;sessionId=s;type=event;name=1;text=", recordOf(0));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
    reopen(folder.options());
    EXPECT_EQ(0U, LogCollector::getPendingCount());
    EXPECT_EQ(LogCollector::StoreFormat::HEAD_BYTES * folder.segments().size(), folder.size());
}

TEST_F(StoredDeliveryTest, DeliversWhatIsLeftAlsoWhileLoggingIsOff) {
    ASSERT_TRUE(open());
    logEvents(1, 2);
    Util::SingletonStorage::destroyAll();
    LogCollector::configure(UUID, server.getUrl() + "/log");
    LogCollector::setDeliveredCallback([this] { delivered.raise(); });
    ASSERT_TRUE(open());
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(numbers(1, 2), names());
}

TEST_F(StoredDeliveryTest, StoresWhatWaitsAlreadyBehindWhatIsLeft) {
    ASSERT_TRUE(open());
    logEvents(1, 2);
    restart();
    logEvents(3, 4);
    ASSERT_TRUE(open());
    logEvents(5, 5);
    reopen(folder.options());
    deliver();
    EXPECT_EQ(numbers(1, 5), names());
}

TEST_F(StoredDeliveryTest, StoresTheRecordThatIsOnItsWay) {
    server.setDefaultAnswer(Answer::never());
    LogCollector::configure(UUID, server.getUrl() + "/log");
    logEvents(1, 2);
    ASSERT_TRUE(server.waitForRequest(1));
    ASSERT_TRUE(open());
    // Its answer never came: so it may come twice, but it is not lost.
    server.setDefaultAnswer(Answer::status(200));
    reopen(folder.options());
    deliver();
    EXPECT_THAT(names(), ElementsAre("1", "1", "2"));
}

TEST_F(StoredDeliveryTest, TakesADeliveredRecordOutBeforeTheNextIsSent) {
    server.script({Answer::status(200), Answer::status(200).held()});
    ASSERT_TRUE(open());
    LogCollector::configure(UUID, server.getUrl() + "/log");
    logEvents(1, 3);
    ASSERT_TRUE(server.waitForRequest(2));
    reopen(folder.options());
    EXPECT_EQ(2U, LogCollector::getPendingCount());
    server.release();
    deliver();
    EXPECT_THAT(names(), ElementsAre("1", "2", "2", "3"));
}

TEST_F(StoredDeliveryTest, KeepsARecordWhoseRequestFails) {
    server.script({Answer::status(404), Answer::status(200).held()});
    ASSERT_TRUE(open());
    LogCollector::configure(UUID, server.getUrl() + "/log");
    logEvents(1, 2);
    ASSERT_TRUE(server.waitForRequest(2));
    reopen(folder.options());
    EXPECT_EQ(2U, LogCollector::getPendingCount());
    server.release();
    deliver();
    // After a start they are in the order in which they were logged.
    EXPECT_THAT(names(), ElementsAre("1", "2", "1", "2"));
}

TEST_F(StoredDeliveryTest, GoesOnInMemoryWhereThereIsNoStore) {
    LogStoreOptions options = folder.options();
    options.folder += "/missing/store";
    EXPECT_FALSE(open(options));
    EXPECT_TRUE(log.contains("LogStore: " + options.folder +
                             " is not used, records are in memory only: No such file or "
                             "directory"));
    logEvents(1, 3);
    deliver();
    EXPECT_EQ(numbers(1, 3), names());
    // Another one may be tried.
    ASSERT_TRUE(open());
    EXPECT_FALSE(open());
    EXPECT_TRUE(
        log.contains("LogSender: there is a store already, " + folder.path() + " is not used"));
}

TEST_F(StoredDeliveryTest, DoesNotStoreWhatCanNeverBeSentOrDoesNotFit) {
    ASSERT_TRUE(open(folder.options(LogStoreOptions::MAX_BYTES_LEAST)));
    LogCollector::logEvent("s", "long", {{"text", std::string(4000, 'x')}});
    EXPECT_THAT(log.messages(),
                testing::Contains(testing::MatchesRegex(
                    "LogKeeper: a record of 4[0-9]+ bytes is too long for the store")));
    EXPECT_EQ(1U, LogCollector::getPendingCount());
    restart();
    EXPECT_EQ(0U, LogCollector::getPendingCount());
    std::filesystem::remove_all(folder.path());
    ASSERT_TRUE(open(folder.options(LogStoreOptions::MAX_BYTES_MOST)));
    LogCollector::logEvent("s", "unsendable", {{"text", std::string(400000, '%')}});
    EXPECT_EQ(1U, LogCollector::getPendingCount());
    EXPECT_THAT(folder.segments(), IsEmpty());
}

TEST_F(StoredDeliveryTest, DropsTheOldestAndTellsHowManyInOneRecord) {
    const LogStoreOptions options = folder.options(BOUND);
    ASSERT_TRUE(open(options));
    for (int i = 1; i <= 200; ++i) {
        logEvents(i, i, std::string(100, 'x'));
        ASSERT_LE(folder.size(), static_cast<std::size_t>(BOUND)) << i;
    }
    deliver();
    expectAllAreThereOrCounted(200);
    EXPECT_TRUE(log.containsPart("LogKeeper: the store is at its bound, the oldest "));
}

TEST_F(StoredDeliveryTest, CountsOnFromTheNoticeOfAnEarlierProcess) {
    const LogStoreOptions options = folder.options(BOUND);
    ASSERT_TRUE(open(options));
    for (int round = 0; round < 10; ++round) {
        logEvents(20 * round + 1, 20 * round + 20, std::string(100, 'x'));
        reopen(options);
    }
    deliver();
    expectAllAreThereOrCounted(200);
}

TEST_F(StoredDeliveryTest, NeverDropsTheRecordThatIsOnItsWay) {
    server.script({Answer::status(200).held(), Answer::status(200).held()});
    const LogStoreOptions options = folder.options(BOUND);
    ASSERT_TRUE(open(options));
    LogCollector::configure(UUID, server.getUrl() + "/log");
    logEvents(1, 1, std::string(100, 'x'));
    ASSERT_TRUE(server.waitForRequest(1));
    logEvents(2, 200, std::string(100, 'x'));
    // The process ends: the record and the notice are both there still.
    restart();
    ASSERT_TRUE(open(options));
    server.release(2);
    deliver();
    const std::vector<std::string> all = names();
    EXPECT_EQ(2, std::count(all.begin(), all.end(), "1"));
    expectAllAreThereOrCounted(200);
}

TEST_F(StoredDeliveryTest, DoesNotCountTwiceWhatANoticeOnItsWayTells) {
    const LogStoreOptions options = folder.options(BOUND);
    ASSERT_TRUE(open(options));
    logEvents(1, 100, std::string(100, 'x'));
    // The oldest record fails and so waits behind the notice, which is of a newer segment.
    server.script({Answer::status(200).held(), Answer::status(404).held()});
    server.setDefaultAnswer(Answer::status(200).held());
    useServer();
    const auto isNotice = [](const std::string& name) { return name[0] == '('; };
    for (std::size_t count = 1;; ++count) {
        ASSERT_TRUE(server.waitForRequest(count));
        if (isNotice(names().back())) {
            break;
        }
        server.release();
    }
    logEvents(101, 200, std::string(100, 'x'));
    server.setDefaultAnswer(Answer::status(200));
    server.release(1000);
    ASSERT_TRUE(delivered.waitFor(1));
    int told = 0;
    int arrived = 0;
    for (const std::string& name : names()) {
        if (isNotice(name)) {
            told += std::stoi(name.substr(1));
        } else {
            ++arrived;
        }
    }
    EXPECT_EQ(200 + 1, told + arrived);  // the one that failed is counted and arrived
    const std::vector<std::string> all = names();
    EXPECT_EQ(2, std::count_if(all.begin(), all.end(), isNotice));
}

TEST_F(StoredDeliveryTest, KeepsTheBoundWhenItIsLowered) {
    ASSERT_TRUE(open());
    logEvents(1, 100, std::string(100, 'x'));
    reopen(folder.options(LogStoreOptions::MAX_BYTES_LEAST));
    // One segment of the larger bound holds them all.
    EXPECT_LE(folder.size(), static_cast<std::size_t>(LogStoreOptions::MAX_BYTES_LEAST));
    deliver();
    EXPECT_THAT(names(), ElementsAre("(100)"));
}

TEST_F(StoredDeliveryTest, StaysInMemoryWhileTheDiskRefuses) {
    ASSERT_TRUE(open());
    logEvents(1, 1);
    std::filesystem::remove_all(folder.path());
    restart();
    // The folder goes while the store has it and no segment yet.
    ASSERT_TRUE(open());
    std::filesystem::remove_all(folder.path());
    logEvents(2, 4);
    EXPECT_EQ(1U, log.count("LogStore: " + folder.path() +
                            ": no file can be made: No such file or directory; records are in "
                            "memory only until it can"));
    deliver();
    EXPECT_EQ(numbers(2, 4), names());
}

class StoredAgeTest : public StoredDeliveryTest {
  protected:
    StoredAgeTest() { setClock(NOW_S); }

    static void setClock(int64_t seconds) { kdUseManualClockKOR(seconds * NS_PER_S); }

    LogStoreOptions options() const {
        LogStoreOptions options = folder.options();
        options.maxAgeS = 16 * DAY_S;
        return options;
    }
};

TEST_F(StoredAgeTest, DropsWhatIsTooOldAndTells) {
    ASSERT_TRUE(open(options()));
    logEvents(1, 2);
    setClock(NOW_S + 2 * DAY_S);
    logEvents(3, 3);
    setClock(NOW_S + 16 * DAY_S);
    reopen(options());
    EXPECT_EQ(3U, LogCollector::getPendingCount());
    setClock(NOW_S + 16 * DAY_S + 1);
    reopen(options());
    deliver();
    EXPECT_THAT(names(), ElementsAre("3", "(2)"));
}

TEST_F(StoredAgeTest, DropsInTheCourseOfALongLife) {
    ASSERT_TRUE(open(options()));
    logEvents(1, 3);  // the first is on its way
    setClock(NOW_S + 20 * DAY_S);
    logEvents(4, 4);
    EXPECT_EQ(3U, LogCollector::getPendingCount());  // "1", the notice and "4"
    setClock(NOW_S + 40 * DAY_S);
    deliver();  // nothing was logged meanwhile
    EXPECT_THAT(names(), ElementsAre("1", "(3)"));
}

TEST_F(StoredAgeTest, KeepsARecordForASixteenthMoreAtMost) {
    ASSERT_TRUE(open(options()));
    logEvents(1, 1);
    setClock(NOW_S + DAY_S);
    logEvents(2, 2);  // of the same segment
    setClock(NOW_S + DAY_S + 1);
    logEvents(3, 3);
    setClock(NOW_S + 17 * DAY_S);
    reopen(options());
    EXPECT_EQ(3U, LogCollector::getPendingCount());
    setClock(NOW_S + 17 * DAY_S + 1);
    reopen(options());
    deliver();
    EXPECT_THAT(names(), ElementsAre("3", "(2)"));
}

TEST_F(StoredAgeTest, LosesNothingToAClockThatIsSetBack) {
    LogStoreOptions small = options();
    small.maxBytes = LogStoreOptions::MAX_BYTES_LEAST;
    const std::string text(300, 'x');  // each record has a segment of its own
    ASSERT_TRUE(open(small));
    logEvents(1, 1, text);
    setClock(NOW_S - 1000 * DAY_S);
    logEvents(2, 2, text);
    reopen(small);
    logEvents(3, 3, text);
    EXPECT_EQ(3U, folder.segments().size());
    // And is right again: what was logged meanwhile is not old.
    setClock(NOW_S + DAY_S);
    reopen(small);
    logEvents(4, 4, text);
    deliver();
    EXPECT_EQ(numbers(1, 4), names());
}

}  // namespace
