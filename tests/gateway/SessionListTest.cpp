#include "gateway/SessionList.h"

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "core/util/Time.h"

namespace {

using Gateway::RequestHead;
using Gateway::RequestSummary;
using Gateway::SessionList;
using Util::NS_PER_MS;
using Json = nlohmann::json;

RequestHead head(const std::string& uuid = "u1") {
    RequestHead made;
    made.path = "/asrgw_chunked";
    made.uuid = uuid;
    return made;
}

Json changes(const SessionList& list, const std::string& instance = "", uint64_t after = 0) {
    return Json::parse(list.describeChanges(instance, after));
}

}  // namespace

TEST(SessionList, DescribesASessionFromItsHeadToItsEnd) {
    SessionList list;
    const SessionList::Id id = list.begin(head());
    Json session = changes(list)["sessions"][0];
    EXPECT_EQ(true, session["isRunning"]);
    EXPECT_EQ(true, session["isStreamed"]);
    EXPECT_EQ("u1", session["uuid"]);
    list.addPiece(id, 2 * NS_PER_MS, 300);
    list.addPiece(id, 102 * NS_PER_MS, 3200);
    list.addPiece(id, 152 * NS_PER_MS, 100);
    list.addSound(id, std::vector<int16_t>(1600, 7));
    RequestSummary summary;
    summary.language = "en-US";
    summary.bodyBytes = 3600;
    list.update(id, summary);
    session = changes(list)["sessions"][0];
    EXPECT_EQ(true, session["isRunning"]);
    EXPECT_EQ("en-US", session["language"]);
    EXPECT_EQ(Json::parse("[[2.0,300],[102.0,3200],[152.0,100]]"), session["pieces"]);
    EXPECT_EQ(100.0, session["longestGapMs"]);
    EXPECT_EQ(152.0, session["lastMs"]);
    EXPECT_EQ(100, session["soundMs"]);
    summary.hypotheses = {{"go", 0.5}, {"no", 0.25}};
    list.end(id, 200, summary, 17 * NS_PER_MS);
    session = changes(list)["sessions"][0];
    EXPECT_EQ(false, session["isRunning"]);
    EXPECT_EQ(200, session["status"]);
    EXPECT_EQ(17.0, session["answerMs"]);
    EXPECT_EQ(Json::parse(R"([{"text":"go","confidence":0.5},{"text":"no","confidence":0.25}])"),
              session["hypotheses"]);
}

TEST(SessionList, GivesAReaderWhatItDoesNotKnow) {
    SessionList list;
    const SessionList::Id first = list.begin(head("first"));
    list.begin(head("second"));
    const Json all = changes(list);
    EXPECT_EQ(2U, all["sessions"].size());
    const std::string instance = all["instance"];
    const uint64_t known = all["version"];
    EXPECT_EQ(0U, changes(list, instance, known)["sessions"].size());
    list.addPiece(first, 0, 1);
    list.addRecord("u1", "started", 200);
    const Json next = changes(list, instance, known);
    ASSERT_EQ(1U, next["sessions"].size());
    EXPECT_EQ("first", next["sessions"][0]["uuid"]);
    EXPECT_EQ(Json::parse("[1,2]"), next["ids"]);
    ASSERT_EQ(1U, next["records"].size());
    EXPECT_EQ("started", next["records"][0]["text"]);
    EXPECT_EQ(0U, changes(list, instance, next["version"])["records"].size());
    // A reader of a gateway that has ended knows nothing of this one.
    EXPECT_EQ(2U, changes(list, "another", next["version"])["sessions"].size());
}

TEST(SessionList, ForgetsTheOldestSessions) {
    SessionList list;
    const SessionList::Id first = list.begin(head("first"));
    list.addSound(first, {1, 2, 3});
    EXPECT_NE("", list.makeWav(first));
    for (std::size_t i = 0; i < SessionList::MAX_SESSIONS; ++i) {
        list.begin(head());
    }
    EXPECT_EQ(SessionList::MAX_SESSIONS, changes(list)["sessions"].size());
    EXPECT_EQ(first + 1, changes(list)["ids"][0]);
    EXPECT_EQ("", list.makeWav(first));
    const Json before = changes(list);
    list.addPiece(first, 0, 1);
    list.addSound(first, {1});
    list.update(first, RequestSummary());
    list.end(first, 200, RequestSummary(), 0);
    EXPECT_EQ(before, changes(list));
}

TEST(SessionList, ForgetsTheOldestRecords) {
    SessionList list;
    for (std::size_t i = 0; i <= SessionList::MAX_RECORDS; ++i) {
        list.addRecord("u1", std::to_string(i), 200);
    }
    const Json records = changes(list)["records"];
    EXPECT_EQ(SessionList::MAX_RECORDS, records.size());
    EXPECT_EQ("1", records[0]["text"]);
}

TEST(SessionList, CutsWhatIsTooLong) {
    SessionList list;
    const std::string endless(SessionList::MAX_TEXT_BYTES + 1, 'x');
    const std::string shortened = std::string(SessionList::MAX_TEXT_BYTES, 'x') + "...";
    RequestHead long_head = head(endless);
    long_head.sessionId = endless;
    const SessionList::Id id = list.begin(long_head);
    RequestSummary summary;
    summary.language = summary.topic = summary.soundType = endless;
    summary.transcripts = summary.refusal = endless;
    list.update(id, summary);
    list.addRecord(endless, endless, 200);
    for (std::size_t i = 0; i <= SessionList::MAX_PIECES; ++i) {
        list.addPiece(id, 0, 1);
    }
    list.addSound(id, std::vector<int16_t>(SessionList::MAX_SAMPLES - 1));
    list.addSound(id, std::vector<int16_t>(3201));
    const Json all = changes(list);
    const Json& session = all["sessions"][0];
    for (const char* name :
         {"uuid", "sessionId", "language", "topic", "soundType", "transcripts", "refusal"}) {
        EXPECT_EQ(shortened, session[name]) << name;
    }
    EXPECT_EQ(shortened, all["records"][0]["uuid"]);
    EXPECT_EQ(shortened, all["records"][0]["text"]);
    EXPECT_EQ(SessionList::MAX_PIECES, session["pieces"].size());
    EXPECT_EQ(SessionList::MAX_PIECES + 1, session["pieceCount"]);
    EXPECT_EQ(30000, session["playableMs"]);
    EXPECT_EQ(30200, session["soundMs"]);
    EXPECT_EQ(44 + 2 * SessionList::MAX_SAMPLES, list.makeWav(id).size());
}

TEST(SessionList, WritesAnyBytesAsAscii) {
    SessionList list;
    list.addRecord(std::string("\xff\x00</script>", 11), "\xd1\x8f\xe2\x80\xae\xc3", 400);
    const std::string text = list.describeChanges("", 0);
    for (const char byte : text) {
        EXPECT_TRUE(byte >= ' ' && byte <= '~') << static_cast<int>(byte);
    }
    const Json record = Json::parse(text)["records"][0];
    EXPECT_EQ(std::string("\xef\xbf\xbd\x00</script>", 13), record["uuid"]);
    EXPECT_EQ("\xd1\x8f\xe2\x80\xae\xef\xbf\xbd", record["text"]);
}

TEST(SessionList, MakesAWavFileOfTheSound) {
    SessionList list;
    const SessionList::Id id = list.begin(head());
    EXPECT_EQ("", list.makeWav(id));
    list.addSound(id, {1, -2});
    EXPECT_EQ(std::string("RIFF\x28\0\0\0WAVEfmt \x10\0\0\0\x01\0\x01\0\x80\x3e\0\0\0\x7d\0\0\x02\0"
                          "\x10\0data\x04\0\0\0\x01\0\xfe\xff",
                          48),
              list.makeWav(id));
    EXPECT_EQ("", list.makeWav(id + 1));
}
