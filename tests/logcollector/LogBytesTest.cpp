#include "LogFixture.h"

namespace {

constexpr int64_t PAUSE_MS = 3000;
constexpr std::size_t MEGABYTE = std::size_t{1024} * 1024;

std::string allBytes() {
    std::string bytes;
    for (int value = 0; value < 256; ++value) {
        bytes += static_cast<char>(value);
    }
    return bytes;
}

/** Names, keys and values of any bytes, at the endpoint as they were given. */
class LogBytesTest : public LogFixture {
  protected:
    static std::string recordText(const std::string& sessionId, const std::string& name,
                                  const std::string& rest) {
        return "time=100-01-29 00:00:00;sessionId=" + sessionId + ";type=event;name=" + name + rest;
    }
};

TEST_F(LogBytesTest, EveryByteArrivesAsItWas) {
    const std::string bytes = allBytes();
    LogCollector::startSession(bytes);
    LogCollector::logEvent(bytes, bytes, {{bytes, bytes}, {bytes + "2", ""}});
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(recordText(bytes, bytes, ";" + bytes + "=" + bytes + ";" + bytes + "2="),
              recordOf(0));
    // Nothing of it reached the head of the request uncoded.
    EXPECT_EQ(std::string::npos, addressOf(0).find_first_of("\r\n;# "));
}

TEST_F(LogBytesTest, InvalidUtf8AndSeparatorsArriveAsTheyWere) {
    LogCollector::startSession("s");
    const std::vector<std::string> texts = {"\xC3",      "\xED\xA0\x80", "\xF8\x88\x80\x80\x80",
                                            "\xC0\x80",  "%00%zz%",      "a+b",
                                            ";=;=&&?##", "  ",           "\r\n\r\n"};
    for (const std::string& text : texts) {
        LogCollector::logEvent("s", text, {{text, text}});
    }
    ASSERT_TRUE(server.waitForRequest(texts.size()));
    for (std::size_t i = 0; i < texts.size(); ++i) {
        EXPECT_EQ(recordText("s", texts[i], ";" + texts[i] + "=" + texts[i]), recordOf(i));
    }
}

TEST_F(LogBytesTest, TheLongestRecordArrives) {
    LogCollector::startSession("s");
    const std::string around = recordText("s", "n", ";k=");
    const std::size_t coding = Util::UrlCoder::urlEncodeString(around).size();
    const std::string value(1000000 - coding, 'a');
    LogCollector::logEvent("s", "n", {{"k", value}});
    ASSERT_TRUE(delivered.waitFor(1, std::chrono::seconds(60)));
    EXPECT_TRUE(around + value == recordOf(0));
}

TEST_F(LogBytesTest, ARecordThatIsTooLongFailsWithoutStoppingTheOthers) {
    LogCollector::startSession("s");
    for (const std::string& value :
         {std::string(MEGABYTE, 'a'), std::string(400000, '\0'), std::string(10 * MEGABYTE, '=')}) {
        LogCollector::logEvent("s", "long", {{"k", value}});
    }
    ASSERT_TRUE(log.waitFor(FAILURE, 2));
    EXPECT_TRUE(log.containsPart("LogCollectorNetworkTask: a record of "));
    LogCollector::logEvent("s", "first", {});
    LogCollector::logEvent("s", "second", {});
    EXPECT_EQ(5U, LogCollector::getPendingCount());
    for (int pauses = 0; pauses < 4; ++pauses) {
        settle();
        advanceMs(PAUSE_MS);
    }
    ASSERT_TRUE(server.waitForRequest(2));
    // The last answer may still be on its way.
    for (int i = 0; i < 10000 && LogCollector::getPendingCount() != 3; ++i) {
        settle();
    }
    EXPECT_THAT(records(), ::testing::ElementsAre(recordText("s", "first", ""),
                                                  recordText("s", "second", "")));
    EXPECT_EQ(3U, LogCollector::getPendingCount());
}

TEST_F(LogBytesTest, AUuidGoesIntoTheAddressAsItIs) {
    LogCollector::startSession("s");
    LogCollector::configure("a%20b&c=\xC3\xA4");
    LogCollector::logEvent("s", "n", {});
    ASSERT_TRUE(delivered.waitFor(1));
    EXPECT_EQ(0U, addressOf(0).find("/log?uuid=a%20b&c=\xC3\xA4&logmessage=time%3D"));
}

}  // namespace
