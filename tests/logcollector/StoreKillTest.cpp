// Processes that are killed while they log into a store, deliver from it and clean it up.
#include <gmock/gmock.h>

#include <chrono>
#include <csignal>
#include <map>
#include <random>
#include <set>
#include <sstream>

#include "LogFixture.h"
#include "StoreFolder.h"
#include "app/KilledRecord.h"
#include "support/ChildProcess.h"
#include "support/ScriptedHttpServer.h"

using ::testing::Each;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using TestSupport::ChildProcess;
using TestSupport::ScriptedHttpServer;

namespace {

const char* const NOTICE = ";sessionId=logStore;type=error;name=logRecordsDropped;count=";
const char* const LEFT_BY_A_CUT_WRITE =
    "LogStore: [^ ]+ is damaged: [0-9][0-9]?[0-9]? bytes are no record, [01] marks cannot be read, "
    "[0-9]+ records are whole";
constexpr int64_t ROOMY = 128 << 10;
constexpr int64_t TIGHT = 4 << 10;

std::string bodyOf(int number) {
    std::string body = std::string(";sessionId=") + KILLED_SESSION + ";type=event;name=killed";
    for (const auto& param : paramsOfKilled(number)) {
        body += ";" + param.first + "=" + param.second;
    }
    return body;
}

/** What arrived at the endpoint. */
struct Arrivals {
    std::map<int, int> times; /**< of each record */
    std::vector<int> order;   /**< in which they arrived for the first time */
    std::set<std::string> notices;
    std::vector<std::string> torn;
    int repeated = 0;

    explicit Arrivals(const ScriptedHttpServer& server) {
        for (std::size_t i = 0; i < server.getRequestCount(); ++i) {
            take(recordIn(server.getRequest(i).line()));
        }
    }

    int lost() const {
        int sum = 0;
        for (const std::string& notice : notices) {
            sum += std::stoi(notice.substr(notice.rfind('=') + 1));
        }
        return sum;
    }

  private:
    void take(const std::string& record) {
        if (record.find(NOTICE) != std::string::npos) {
            notices.insert(record);
            return;
        }
        const std::size_t body = record.find(";sessionId=");
        const std::size_t at = record.find(";number=");
        const int number = at == std::string::npos ? 0 : std::atoi(record.c_str() + at + 8);
        if (body == std::string::npos || record.substr(body) != bodyOf(number)) {
            torn.push_back(record);
        } else if (++times[number] == 1) {
            order.push_back(number);
        } else {
            ++repeated;
        }
    }
};

/** Starts processes on one folder, one after the other, and kills them. */
class Killer {
  public:
    Killer(unsigned seed, int64_t bound, int mostInBurst)
        : random(seed), maxBytes(std::to_string(bound)), burst(1, mostInBurst) {}

    void killOne() {
        ChildProcess child(command(next, burst(random)));
        waitForTheMoment(child);
        child.sendSignal(SIGKILL);
        const int first = next;
        while (takeOutput(child)) {
        }
        EXPECT_EQ(-1, child.wait());
        // One more may have been stored without word of it.
        next = std::max(first, safe.empty() ? 0 : *safe.rbegin() + 1) + 1;
    }

    /** Has what is left delivered. */
    void finish() {
        ChildProcess child(command(next, 0));
        while (takeOutput(child)) {
        }
        EXPECT_EQ(0, child.wait());
    }

    ScriptedHttpServer server;
    StoreFolder folder;
    std::set<int> safe; /**< the call has returned for these */
    std::vector<std::string> messages;

  private:
    std::vector<std::string> command(int first, int count) const {
        return {LOG_STORE_APP, server.getUrl() + "/log", folder.path(),
                maxBytes,      std::to_string(first),    std::to_string(count)};
    }

    // Some records after the start, then up to a third of a millisecond more.
    void waitForTheMoment(ChildProcess& child) {
        const auto records = std::uniform_int_distribution<std::size_t>(0, 80)(random);
        const bool whileDelivering = records % 2 == 0;
        const std::size_t before = whileDelivering ? server.getRequestCount() : safe.size();
        while ((whileDelivering ? server.getRequestCount() : safe.size()) < before + records &&
               takeOutput(child)) {
        }
        const auto pause =
            std::chrono::microseconds(std::uniform_int_distribution<int>(0, 333)(random));
        const auto end = std::chrono::steady_clock::now() + pause;
        while (std::chrono::steady_clock::now() < end) {
        }
    }

    bool takeOutput(ChildProcess& child) {
        const std::string piece = child.read();
        unfinished += piece;
        std::size_t end = 0;
        while ((end = unfinished.find('\n')) != std::string::npos) {
            const std::string line = unfinished.substr(0, end);
            unfinished.erase(0, end + 1);
            if (const int number = std::atoi(line.c_str()); number > 0) {
                safe.insert(number);
            } else {
                messages.push_back(line);
            }
        }
        return !piece.empty();
    }

    std::mt19937 random;
    const std::string maxBytes;
    std::uniform_int_distribution<int> burst;
    int next = 1;
    std::string unfinished;
};

void killInARoomyStore(unsigned seed, int kills) {
    Killer killer(seed, ROOMY, 60);
    for (int i = 0; i < kills && !::testing::Test::HasFailure(); ++i) {
        killer.killOne();
    }
    killer.finish();
    const Arrivals arrivals(killer.server);
    EXPECT_THAT(arrivals.torn, IsEmpty());
    EXPECT_THAT(arrivals.notices, IsEmpty());
    // A write that crosses two pages of the file may end between them. Few do: of writes that all
    // crossed, one of fifty kills cut one.
    EXPECT_THAT(killer.messages, Each(MatchesRegex(LEFT_BY_A_CUT_WRITE)));
    EXPECT_LE(killer.messages.size(), static_cast<std::size_t>(kills) / 10);
    std::vector<int> lost;
    for (const int number : killer.safe) {
        if (arrivals.times.count(number) == 0) {
            lost.push_back(number);
        }
    }
    EXPECT_THAT(lost, IsEmpty());
    EXPECT_TRUE(std::is_sorted(arrivals.order.begin(), arrivals.order.end()));
    EXPECT_LE(arrivals.repeated, kills);
    EXPECT_GT(killer.safe.size(), static_cast<std::size_t>(kills));
    ::testing::Test::RecordProperty("records", static_cast<int>(arrivals.order.size()));
    ::testing::Test::RecordProperty("repeated", arrivals.repeated);
}

void killAtTheBound(unsigned seed, int kills) {
    Killer killer(seed, TIGHT, 150);
    for (int i = 0; i < kills && !::testing::Test::HasFailure(); ++i) {
        killer.killOne();
        EXPECT_LE(killer.folder.size(), static_cast<std::size_t>(TIGHT) * 2);
    }
    killer.finish();
    const Arrivals arrivals(killer.server);
    EXPECT_THAT(arrivals.torn, IsEmpty());
    int missing = 0;
    for (const int number : killer.safe) {
        missing += arrivals.times.count(number) == 0 ? 1 : 0;
    }
    EXPECT_GT(missing, 0);
    // A notice that arrived as its process ended may have been counted on by the next.
    EXPECT_GE(arrivals.lost(), missing);
    EXPECT_LE(arrivals.repeated, kills);
    ::testing::Test::RecordProperty("missing", missing);
    ::testing::Test::RecordProperty("counted", arrivals.lost());
}

TEST(StoreKillTest, LosesAndTearsNothingWhateverTheMoment) {
    killInARoomyStore(1, 70);
}

TEST(StoreKillTest, CountsWhatItDropsWhateverTheMoment) {
    killAtTheBound(2, 30);
}

TEST(StoreKillTest, KeepsASecondProcessOutUntilTheFirstHasEnded) {
    const ScriptedHttpServer server;
    const StoreFolder folder;
    const std::string bound = std::to_string(ROOMY);
    const auto command = [&](const char* burst) {
        return std::vector<std::string>{LOG_STORE_APP, server.getUrl(), folder.path(), bound, "1",
                                        burst};
    };
    ChildProcess first(command("1000"));
    ASSERT_NE("", first.read());
    const ChildProcess::Result second = ChildProcess::run(command("0"));
    EXPECT_EQ(1, second.exitStatus);
    EXPECT_EQ("LogStore: " + folder.path() +
                  " is not used, records are in memory only: another process uses it\n",
              second.output);
    first.sendSignal(SIGKILL);
    EXPECT_EQ(-1, first.wait());
    EXPECT_EQ(0, ChildProcess::run(command("0")).exitStatus);
}

/** The same at 1,000 moments, in four parts. */
class LongStoreKillTest : public ::testing::TestWithParam<unsigned> {};

TEST_P(LongStoreKillTest, LosesAndTearsNothingWhateverTheMoment) {
    killInARoomyStore(100 + GetParam(), 175);
}

TEST_P(LongStoreKillTest, CountsWhatItDropsWhateverTheMoment) {
    killAtTheBound(200 + GetParam(), 75);
}

INSTANTIATE_TEST_SUITE_P(Parts, LongStoreKillTest, ::testing::Range(0U, 4U));

}  // namespace
