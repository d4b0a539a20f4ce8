#include <array>
#include <atomic>
#include <deque>
#include <map>
#include <memory>
#include <set>
#include <thread>

#include "LogFixture.h"
#include "logcollector/impl/LogSender.h"

using LogCollector::LogEvent;
using LogCollector::LogSender;
using TestSupport::Answer;
using TestSupport::ScriptedHttpServer;

namespace {

constexpr int THREADS = 4;
constexpr int RECORDS_PER_THREAD = 2500;
constexpr std::size_t RECORDS = std::size_t{THREADS} * RECORDS_PER_THREAD;
constexpr int64_t RETRY_MS = 3000;
const char* const ATTEMPT = "LogCollectorNetworkTask: request url is ";

/** Thread and number of a record, as it says itself; the text must be that of such a record. */
struct Origin {
    int thread = -1;
    int number = -1;

    bool operator<(const Origin& other) const {
        return thread != other.thread ? thread < other.thread : number < other.number;
    }
    bool operator==(const Origin& other) const {
        return thread == other.thread && number == other.number;
    }
};

void PrintTo(const Origin& origin, std::ostream* out) {
    *out << origin.thread << ":" << origin.number;
}

LogEvent::Params paramsOf(const Origin& origin) {
    return {{"number", std::to_string(origin.number)},
            {"text", std::string(static_cast<std::size_t>(origin.number % 40), ';')},
            {"thread", std::to_string(origin.thread)}};
}

std::string bodyOf(const Origin& origin) {
    std::string text = ";sessionId=s;type=event;name=outage";
    for (const auto& param : paramsOf(origin)) {
        text += ";" + param.first + "=" + param.second;
    }
    return text;
}

/** @return an origin of -1 for a record that is torn */
Origin originOf(const std::string& record) {
    const auto number = [&record](const std::string& key) {
        const std::size_t at = record.find(";" + key + "=");
        return at == std::string::npos ? -1 : std::atoi(record.c_str() + at + key.size() + 2);
    };
    const Origin origin{number("thread"), number("number")};
    const std::size_t body = record.find(";sessionId=");
    const bool whole = origin.thread >= 0 && origin.number >= 0 && record.find("time=") == 0 &&
                       body != std::string::npos && record.substr(body) == bodyOf(origin);
    return whole ? origin : Origin();
}

/** The endpoint in all its moods, always at the same port. */
class Endpoint {
  public:
    Endpoint() { open(); }

    std::string getUrl() const { return server->getUrl(); }

    std::size_t getRequestCount() const { return server->getRequestCount(); }

    /** Ends the server in the middle of whatever it does; connections are then refused. */
    void kill() {
        port = server->getPort();
        for (std::size_t i = 0; i < server->getRequestCount(); ++i) {
            received.insert(recordIn(server->getRequest(i).line()));
        }
        server.reset();
    }

    void open() {
        server = std::make_unique<ScriptedHttpServer>(port);
        server->script(moods());
    }

    bool isOpen() const { return server != nullptr; }

    /** All records that came in at some time, each once. */
    const std::set<std::string>& getReceived() const { return received; }

  private:
    /** Faults among answers of 200, more than are asked for in the life of one server. */
    static std::vector<Answer> moods() {
        const Answer fine = Answer::status(200);
        const std::vector<Answer> faults = {Answer::status(500),
                                            Answer::status(204),
                                            Answer::resetAfter(0),
                                            Answer::never(),
                                            Answer::status(404),
                                            Answer::closing(),
                                            Answer::status(503),
                                            Answer::status(503),
                                            Answer::raw("HTTP/1.1 200"),
                                            Answer::status(302),
                                            Answer::raw("rubbish").thenClose()};
        std::vector<Answer> all;
        for (std::size_t round = 0; round < 5; ++round) {
            for (const Answer& fault : faults) {
                all.insert(all.end(), 40, fine);
                all.insert(all.end(), 1 + round % 3, fault);
            }
        }
        return all;
    }

    unsigned short port = 0;
    std::unique_ptr<ScriptedHttpServer> server;
    std::set<std::string> received;
};

class LogOutageTest : public LogFixture {
  protected:
    /** Replays the sender's own account of attempts and failures against the rules of the queue. */
    void checkOrder() const {
        std::deque<Origin> failed;
        std::set<Origin> known;
        std::array<int, THREADS> next{};
        Origin current;
        bool over = true;
        for (const std::string& message : log.messages()) {
            if (message == FAILURE) {
                failed.push_back(current);
                over = true;
            } else if (message.find(ATTEMPT) == 0) {
                const Origin origin = originOf(recordIn(message));
                ASSERT_GE(origin.thread, 0) << message;
                if (!over && origin == current) {
                    continue;  // the network's own second attempt
                }
                if (known.insert(origin).second) {
                    // For the first time: in the order of its thread.
                    EXPECT_EQ(next.at(static_cast<std::size_t>(origin.thread))++, origin.number);
                } else {
                    // Again: in the order in which they failed.
                    ASSERT_FALSE(failed.empty());
                    ASSERT_EQ(failed.front(), origin);
                    failed.pop_front();
                }
                current = origin;
                over = false;
            }
        }
        EXPECT_TRUE(failed.empty());
        EXPECT_EQ(RECORDS, known.size());
    }
};

TEST_F(LogOutageTest, EveryRecordArrivesInTheOrderOfTheQueueWhateverTheEndpointDoes) {
    Endpoint endpoint;
    LogCollector::configure(UUID, endpoint.getUrl());
    LogSender sender;
    Signal done;
    std::atomic<int> logging{THREADS};
    sender.setDeliveredCallback([&] {
        if (logging == 0) {
            done.raise();
        }
    });
    std::vector<std::thread> threads;
    threads.reserve(THREADS);
    for (int thread = 0; thread < THREADS; ++thread) {
        threads.emplace_back([&sender, &logging, thread] {
            for (int number = 0; number < RECORDS_PER_THREAD; ++number) {
                const Util::EventLock lock;
                if (number == RECORDS_PER_THREAD - 1) {
                    --logging;
                }
                sender.sendLogRecord(boost::make_shared<LogEvent>(LogEvent::event, "outage",
                                                                  paramsOf({thread, number})),
                                     "s");
            }
        });
    }

    // Where nothing moves, it is time that is missing; now and then the server goes or returns.
    std::size_t killings = 0;
    std::size_t before = 0;
    while (!done.waitFor(1, std::chrono::milliseconds(2))) {
        if (!endpoint.isOpen()) {
            endpoint.open();
            before = 0;
        } else if (endpoint.getRequestCount() == before) {
            advanceMs(RETRY_MS);
        } else {
            before = endpoint.getRequestCount();
            if (before > 2000) {
                endpoint.kill();
                ++killings;
                advanceMs(RETRY_MS);
            }
        }
        ASSERT_FALSE(HasFatalFailure());
    }
    for (std::thread& thread : threads) {
        thread.join();
    }

    EXPECT_GE(killings, 3U);
    EXPECT_EQ(0U, sender.getPendingCount());
    EXPECT_FALSE(sender.isWorking());
    EXPECT_FALSE(sender.isTimerRunning());
    endpoint.kill();
    std::set<Origin> arrived;
    for (const std::string& record : endpoint.getReceived()) {
        const Origin origin = originOf(record);
        EXPECT_GE(origin.thread, 0) << record;
        arrived.insert(origin);
    }
    EXPECT_EQ(RECORDS, arrived.size());
    EXPECT_GT(log.count(FAILURE), 50U);
    checkOrder();
}

TEST_F(LogOutageTest, EightThreadsMayLogWhileTheConfigurationChanges) {
    constexpr int MANY = 8;
    constexpr int PER_THREAD = 100;
    ScriptedHttpServer other;
    const std::array<std::string, 2> urls = {server.getUrl() + "/a", other.getUrl() + "/b"};
    Logger::setLevel(Logger::SILENT);
    std::vector<Answer> flapping;
    for (int i = 0; i < 100; ++i) {
        flapping.insert(flapping.end(), {Answer::status(200), Answer::status(200),
                                         Answer::status(204), Answer::resetAfter(0)});
    }
    server.script(flapping);
    other.script(flapping);
    std::atomic<int> running{MANY};
    std::vector<std::thread> threads;
    threads.reserve(MANY);
    for (int thread = 0; thread < MANY; ++thread) {
        threads.emplace_back([&, thread] {
            const std::string session = std::to_string(thread);
            LogCollector::startSession(session);
            for (int i = 0; i < PER_THREAD - 1; ++i) {
                LogCollector::logEvent(session, "n", {{"i", std::to_string(i)}});
            }
            LogCollector::stopSession(session);
            --running;
        });
    }
    for (std::size_t i = 0; running > 0 || LogCollector::getPendingCount() > 0; ++i) {
        LogCollector::configure(std::to_string(i), urls[i % 2]);
        LogCollector::setDeliveredCallback([this] { delivered.raise(); });
        EXPECT_TRUE(LogCollector::isLoggingEnabled());
        EXPECT_EQ(urls[i % 2], LogCollector::getUrl());
        advanceMs(RETRY_MS);
        settle();
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    std::set<std::string> arrived;
    for (const ScriptedHttpServer* endpoint : {&server, &other}) {
        for (std::size_t i = 0; i < endpoint->getRequestCount(); ++i) {
            const std::string record = recordIn(endpoint->getRequest(i).line());
            arrived.insert(record.substr(record.find(";sessionId=")));
        }
    }
    EXPECT_EQ(static_cast<std::size_t>(MANY * PER_THREAD), arrived.size());
}

}  // namespace
