// The live view of the detector: its line, and a microphone in a real sound server.
#include "cli/LiveVad.h"

#include <gmock/gmock.h>

#include <csignal>
#include <nlohmann/json.hpp>
#include <sstream>

#include "SoundFiles.h"
#include "ToolProcess.h"
#include "support/PulseServer.h"
#include "support/ScratchDirectory.h"

namespace {

using ::testing::HasSubstr;

TEST(LiveVad, ShowsActivityAgainstBothThresholds) {
    const Cli::LiveThresholds thresholds{0.5, 0.25};
    EXPECT_EQ(Cli::activityBar(0, thresholds, 9), "--:-|----");
    EXPECT_EQ(Cli::activityBar(0.4, thresholds, 9), "##:#|----");
    EXPECT_EQ(Cli::activityBar(1, thresholds, 9), "##:#|####");
    EXPECT_EQ(Cli::activityBar(7, thresholds, 9), "##:#|####");
}

TEST(LiveVad, RewritesOneLineAndPutsEventsAboveIt) {
    std::ostringstream out;
    Cli::LiveVad view(out, {0.5, 0.25});
    Talvox::VadBufferAnalysis buffer;
    buffer.endMs = 200;
    buffer.learningNoise = true;
    buffer.level = 4.5F;
    view.printBuffer(buffer);
    EXPECT_EQ(out.str(), "\r\x1b[K  0.2 s  [##------------------]   4.5 dB  learning the noise");
    out.str("");
    buffer.endMs = 1300;
    buffer.learningNoise = false;
    buffer.level = 22.5F;
    buffer.activity = 0.6F;
    buffer.isSpeech = true;
    view.printBuffer(buffer);
    EXPECT_EQ(out.str(),
              "\r\x1b[K  1.3 s  [##########----------]  22.5 dB, noise 4.5  "
              "[#####:####|#--------] speech   sent   1.3 s");
    out.str("");
    Cli::SessionEvent done;
    done.kind = Cli::SessionEvent::RECORDING_DONE;
    done.ms = 1320;
    view.printSessionEvent(done);
    EXPECT_EQ(out.str(),
              "\r\x1b[K       -> session, after 1320 ms: recording is done\n"
              "       a session would have sent 1.3 s of sound\n");
    out.str("");
    // The view goes on, but nothing more would have been sent.
    buffer.endMs = 1400;
    view.printBuffer(buffer);
    EXPECT_THAT(out.str(), HasSubstr("sent   1.3 s"));
}

class MicrophoneTest : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!server.isRunning()) {
            GTEST_SKIP() << "needs a PulseAudio server: " << server.getOutput();
        }
    }

    TestSupport::PulseServer server;
};

TEST_F(MicrophoneTest, IsAnalysedUntilASessionWouldEnd) {
    const TestSupport::ScratchDirectory directory;
    const std::string page = directory.path("report.html");
    TestSupport::ToolProcess tool(TALVOX_BINARY,
                                  {"vad", "--mic", "--as-session", "--json", "--report", page});
    // The sound comes when the tool records.
    ASSERT_THAT(tool.waitForLine("\"recordingBegin\""), HasSubstr("\"ms\""));
    ASSERT_TRUE(server.play(TestSupport::voiceLike(16000, 1)));
    const TestSupport::ToolResult result = tool.wait();
    EXPECT_EQ(result.status, 0) << result.err;
    std::vector<std::string> events;
    std::istringstream lines(result.out);
    for (std::string line; std::getline(lines, line);) {
        const nlohmann::json object = nlohmann::json::parse(line);
        if (object["event"] != "buffer") {
            events.push_back(object["event"]);
        }
    }
    EXPECT_THAT(events, ::testing::ElementsAre("recordingBegin", "speakingBegin", "recordingDone",
                                               "segment"));
    EXPECT_THAT(TestSupport::ScratchDirectory::read(page), HasSubstr("\"file\":\"microphone\""));
}

TEST_F(MicrophoneTest, IsAnalysedUntilTheUserInterrupts) {
    TestSupport::ToolProcess tool(TALVOX_BINARY, {"vad", "--mic"});
    ASSERT_THAT(tool.waitForLine("recording begins"), HasSubstr("-> session, after "));
    tool.signal(SIGINT);
    const TestSupport::ToolResult result = tool.wait();
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_THAT(result.out, HasSubstr("\nsegments of speech: none\n"));
}

TEST_F(MicrophoneTest, ThatDoesNotExistIsAClearError) {
    server.kill();
    const TestSupport::ToolResult result = TestSupport::runTalvox({"vad", "--mic"});
    EXPECT_EQ(result.status, 2);
    EXPECT_THAT(result.err,
                HasSubstr("talvox: cannot record; is there a microphone, and a sound server for "
                          "it?\n"));
}

}  // namespace
