#include "logcollector/LogCollector.h"

#include "LogFixture.h"

using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

const char* const TIME = "time=100-01-29 00:00:00";

class LogCollectorTest : public LogFixture {};

TEST_F(LogCollectorTest, IsOffAtFirstAndHasDefaults) {
    Util::SingletonStorage::destroyAll();
    EXPECT_FALSE(LogCollector::isLoggingEnabled());
    EXPECT_EQ("", LogCollector::getUuid());
    EXPECT_EQ("http://127.0.0.1:8090/log", LogCollector::getUrl());
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

TEST_F(LogCollectorTest, ReplacesTheUuidAloneOrWithTheUrl) {
    LogCollector::configure("u1", "http://127.0.0.1:1/a");
    EXPECT_EQ("u1", LogCollector::getUuid());
    EXPECT_EQ("http://127.0.0.1:1/a", LogCollector::getUrl());
    LogCollector::configure("u2");
    EXPECT_EQ("u2", LogCollector::getUuid());
    EXPECT_EQ("http://127.0.0.1:1/a", LogCollector::getUrl());
}

TEST_F(LogCollectorTest, DoesNothingButSayItIsOffWhileDisabled) {
    LogCollector::startSession("open");
    LogCollector::setLoggingEnabled(false);
    LogCollector::startSession("new");
    LogCollector::stopSession("open");
    LogCollector::stopSession("unknown");
    LogCollector::logEvent("open", "name", {});
    LogCollector::logError("unknown", "name", {});
    EXPECT_THAT(log.messages(), ElementsAre("LogCollector::startSession: the logging is disabled.",
                                            "LogCollector::stopSession: the logging is disabled.",
                                            "LogCollector::stopSession: the logging is disabled.",
                                            "LogCollector::logEvent: the logging is disabled.",
                                            "LogCollector::logError: the logging is disabled."));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

TEST_F(LogCollectorTest, KeepsSessionsOpenWhileDisabled) {
    LogCollector::startSession("open");
    LogCollector::setLoggingEnabled(false);
    LogCollector::stopSession("open");
    LogCollector::setLoggingEnabled(true);
    LogCollector::logEvent("open", "name", {});
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(std::string(TIME) + ";sessionId=open;type=event;name=name", recordOf(0));
}

TEST_F(LogCollectorTest, OpensASessionOnceAndSendsNothing) {
    LogCollector::startSession("id");
    EXPECT_THAT(log.messages(), IsEmpty());
    LogCollector::startSession("id");
    EXPECT_THAT(log.messages(), ElementsAre("LogCollector: session id already exists."));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
    // One session: the second stop finds none.
    LogCollector::stopSession("id");
    log.clear();
    LogCollector::stopSession("id");
    EXPECT_EQ(1U, log.count("LogCollector: session id is not exists."));
}

TEST_F(LogCollectorTest, DropsEventsOfUnknownSessions) {
    LogCollector::logEvent("id", "name", {});
    LogCollector::logError("id", "name", {});
    LogCollector::stopSession("id");
    EXPECT_THAT(log.messages(), ElementsAre("LogCollector: session id is not exists.",
                                            "LogCollector: session id is not exists.",
                                            "LogCollector: session id is not exists."));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

TEST_F(LogCollectorTest, SendsTheEndOfASessionOnceAndOpensItAgain) {
    LogCollector::startSession("id");
    LogCollector::stopSession("id");
    ASSERT_TRUE(delivered.waitFor(1));
    LogCollector::startSession("id");
    LogCollector::logError("id", "name", {{"k", "v"}});
    ASSERT_TRUE(delivered.waitFor(2));
    EXPECT_THAT(records(),
                ElementsAre(std::string(TIME) + ";sessionId=id;type=event;name=logSessionStopped",
                            std::string(TIME) + ";sessionId=id;type=error;name=name;k=v"));
    EXPECT_FALSE(log.containsPart("exists"));
}

TEST_F(LogCollectorTest, ComparesSessionsByteByByte) {
    const std::string withZero("a\0b", 3);
    LogCollector::startSession("a");
    LogCollector::startSession("A");
    LogCollector::startSession("a ");
    LogCollector::startSession(withZero);
    EXPECT_THAT(log.messages(), IsEmpty());
    LogCollector::stopSession("A");
    LogCollector::logEvent("A", "dropped", {});
    EXPECT_TRUE(log.contains("LogCollector: session A is not exists."));
    LogCollector::logEvent(withZero, "name", {});
    ASSERT_TRUE(server.waitForRequest(2));
    EXPECT_EQ(std::string(TIME) + ";sessionId=" + withZero + ";type=event;name=name", recordOf(1));
}

TEST_F(LogCollectorTest, AsksTheEndpointWithUuidAndRecord) {
    LogCollector::startSession("id");
    LogCollector::logEvent("id", "one two", {{"k", "a;b=c&d#e%f+\n"}});
    ASSERT_TRUE(delivered.waitFor(1));
    const std::string path =
        "/log?uuid=0123456789abcdef0123456789abcdef&logmessage="
        "time%3D100-01-29%2000%3A00%3A00%3BsessionId%3Did%3Btype%3Devent%3Bname%3Done%20two"
        "%3Bk%3Da%3Bb%3Dc%26d%23e%25f%2B%0A";
    EXPECT_EQ("GET " + path + " HTTP/1.1", server.getRequest(0).line());
    EXPECT_THAT(log.messages(),
                ElementsAre("LogCollectorNetworkTask: request url is " + server.getUrl() + path));
}

TEST_F(LogCollectorTest, KeepsTheKeyOfAnEmptyUuid) {
    LogCollector::configure("");
    LogCollector::startSession("id");
    LogCollector::stopSession("id");
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(0U, server.getRequest(0).head.find("GET /log?uuid=&logmessage=time%3D"));
}

TEST_F(LogCollectorTest, TellsWhenNothingIsPendingAnyMore) {
    server.setDefaultAnswer(TestSupport::Answer::status(200).held());
    LogCollector::startSession("id");
    LogCollector::logEvent("id", "one", {});
    LogCollector::logEvent("id", "two", {});
    EXPECT_EQ(2U, LogCollector::getPendingCount());
    server.release();
    ASSERT_TRUE(server.waitForRequest(2));
    EXPECT_EQ(1U, LogCollector::getPendingCount());
    EXPECT_FALSE(delivered.waitFor(1, std::chrono::milliseconds(0)));
    server.release();
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(0U, LogCollector::getPendingCount());
}

TEST_F(LogCollectorTest, MayBeCalledAndEndedFromItsCallback) {
    Signal ended;
    LogCollector::setDeliveredCallback([&ended] {
        LogCollector::setDeliveredCallback({});
        LogCollector::logEvent("id", "from the callback", {});
        Util::SingletonStorage::destroyAll();
        ended.raise();
    });
    LogCollector::startSession("id");
    LogCollector::logEvent("id", "one", {});
    ASSERT_TRUE(ended.waitFor(1));
    EXPECT_FALSE(LogCollector::isLoggingEnabled());
}

}  // namespace
