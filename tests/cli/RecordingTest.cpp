// Recordings as they are found on a disk: whole, cut off, broken, hostile.
#include "cli/recording/Recording.h"

#include <gmock/gmock.h>

#include "RecordedSession.h"
#include "cli/UsageError.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::findRecordings;
using Cli::Recording;
using ::testing::ElementsAre;
using Json = nlohmann::ordered_json;
using TestSupport::makeStreamedSession;
using TestSupport::RecordedSession;

class RecordingTest : public ::testing::Test {
  protected:
    /** A recording with these bytes in events.jsonl and a second of silence. */
    Recording read(const std::string& events) {
        RecordedSession made;
        made.addSound(std::vector<int16_t>(RecordedSession::RATE_HZ));
        made.write(folder);
        directory.write("one/events.jsonl", events);
        return Recording(folder);
    }

    std::string refuse(const std::string& sessionJson) {
        read("");
        directory.write("one/session.json", sessionJson);
        try {
            const Recording recording(folder);
        } catch (const Cli::UsageError& error) {
            return error.what();
        }
        return "accepted";
    }

    const TestSupport::ScratchDirectory directory;
    const std::string folder = directory.path("one");
};

const char* const END = "{\"t\":9,\"kind\":\"end\",\"reason\":\"over\"}\n";

TEST_F(RecordingTest, IsReadWithItsSound) {
    makeStreamedSession().write(folder);
    const Recording recording(folder);
    EXPECT_THAT(recording.remarks, ElementsAre());
    EXPECT_EQ(recording.samples.size(), 32000U);
    EXPECT_EQ(recording.sampleRateHz, 16000);
    EXPECT_EQ(Cli::textOf(recording.session, "source"), "a.wav");
    EXPECT_EQ(Cli::textOf(recording.lines.back(), "reason"), "over");
}

TEST_F(RecordingTest, IsSortedByTime) {
    const Recording recording =
        read(std::string("{\"t\":5,\"kind\":\"b\"}\n{\"t\":3,\"kind\":\"a\"}\n"
                         "{\"t\":5,\"kind\":\"c\"}\n") +
             END);
    std::vector<std::string> kinds;
    for (const Json& line : recording.lines) {
        kinds.push_back(Cli::textOf(line, "kind"));
    }
    EXPECT_THAT(kinds, ElementsAre("a", "b", "c", "end"));
}

TEST_F(RecordingTest, IsReadUpToItsLastWholeLine) {
    const Recording recording =
        read("{\"t\":1,\"kind\":\"call\",\"call\":\"start\"}\n{\"t\":2,\"kind\":\"bu");
    ASSERT_EQ(recording.lines.size(), 1U);
    EXPECT_THAT(recording.remarks,
                ElementsAre("The last line of events.jsonl is cut off.",
                            "The recording has no end: its process was killed."));
    // A number may lose digits, so a line counts only with its line feed.
    EXPECT_EQ(read("{\"t\":1,\"kind\":\"call\"}").lines.size(), 0U);
}

TEST_F(RecordingTest, LeavesOutWhatCannotBeRead) {
    const std::string deep = std::string(100000, '[') + std::string(100000, ']');
    const Recording recording = read(
        "nonsense\n[1]\n7\n{\"kind\":\"call\"}\n{\"t\":\"1\",\"kind\":\"call\"}\n{\"t\":1}\n"
        "{\"t\":1,\"kind\":2}\n{\"t\":1.5,\"kind\":\"call\"}\n\n\xff\xfe\n{\"t\":1,\"kind\":"
        "\"new\",\"x\":" +
        deep + "}\n{\"kind\":\"end\",\"reason\":\"disk: full\"}\n");
    EXPECT_THAT(recording.remarks, ElementsAre("10 lines of events.jsonl cannot be read."));
    ASSERT_EQ(recording.lines.size(), 1U);
    EXPECT_EQ(Cli::textOf(recording.lines[0], "kind"), "new");
}

TEST_F(RecordingTest, HasNumbersWithinBounds) {
    const Json object = Json::parse(
        R"({"small":-7,"huge":18446744073709551615,"low":-9223372036854775808,"text":"1","real":2.5,
            "edge":9000000000000000})");
    EXPECT_EQ(Cli::numberOf(object, "small"), -7);
    EXPECT_EQ(Cli::numberOf(object, "edge"), 9000000000000000);
    for (const char* name : {"huge", "low", "text", "real", "none"}) {
        EXPECT_EQ(Cli::numberOf(object, name, 5), 5) << name;
    }
    EXPECT_EQ(Cli::numberOf(Json::array(), "small", 5), 5);
    EXPECT_EQ(Cli::textOf(object, "text"), "1");
    EXPECT_EQ(Cli::textOf(object, "small"), "");
}

TEST_F(RecordingTest, NeedsNoSound) {
    RecordedSession made = makeStreamedSession();
    made.write(folder, false);
    EXPECT_THAT(Recording(folder).remarks, ElementsAre("There is no sound.wav that can be read."));
    made.session["hasSound"] = false;
    made.write(folder, false);
    EXPECT_THAT(Recording(folder).remarks, ElementsAre("The sound was not recorded."));
    made.session["hasSound"] = true;
    for (const Json& rate : {Json(0), Json(-1), Json("16000"), Json(1e18), Json(nullptr)}) {
        made.session["sampleRate"] = rate;
        made.write(folder);
        const Recording recording(folder);
        EXPECT_TRUE(recording.samples.empty()) << rate;
    }
}

TEST_F(RecordingTest, HasAllSoundThatIsInTheFileWhateverItsHeaderSays) {
    const Recording whole = read(END);
    std::string wav = TestSupport::ScratchDirectory::read(folder + "/sound.wav");
    wav.replace(4, 4, "\xff\xff\xff\xff").replace(40, 4, "\xff\xff\xff\xff");
    directory.write("one/sound.wav", wav.substr(0, wav.size() - 3));
    EXPECT_EQ(Recording(folder).samples.size(), whole.samples.size() - 2);
}

TEST_F(RecordingTest, IsRefusedWithAReason) {
    EXPECT_EQ(refuse("{\"format\":2}"),
              folder + " was recorded in format 2; this tool reads format 1");
    EXPECT_EQ(refuse("{}"), folder + " is no recording: its session.json names no format");
    EXPECT_EQ(refuse("{\"format\":\"1\"}"),
              folder + " is no recording: its session.json names no format");
    EXPECT_EQ(refuse("[1]"), folder + " is no recording: its session.json is no JSON object");
    EXPECT_EQ(refuse(""), folder + " is no recording: its session.json is no JSON object");
    EXPECT_EQ(refuse("{\"format\":1}"), "accepted");
}

TEST_F(RecordingTest, IsFoundAmongFolders) {
    for (const char* name : {"many/b", "many/a", "many/c/too deep"}) {
        makeStreamedSession().write(directory.path(name));
    }
    const std::string many = directory.path("many");
    EXPECT_THAT(findRecordings({many, many + "/b"}),
                ElementsAre(many + "/a", many + "/b", many + "/b"));
    EXPECT_THROW(findRecordings({directory.path("none")}), Cli::UsageError);
    EXPECT_THROW(findRecordings({many, directory.path()}), Cli::UsageError);
}

}  // namespace
