// "talvox recognize" as a process against a scripted gateway. The sound plays at its own pace, so
// the utterances are short and the detector is set to be quick.
#include <gmock/gmock.h>
#include <sndfile.h>

#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <set>

#include "RecognizeRun.h"
#include "SoundFiles.h"
#include "ToolProcess.h"
#include "support/OggSpeexDecoder.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"

namespace {

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::Not;
using TestSupport::Answer;
using TestSupport::lines;
using TestSupport::QUICK_VAD;
using TestSupport::recognize;
using TestSupport::resultAnswer;
using TestSupport::runTalvox;
using TestSupport::ScratchDirectory;
using TestSupport::ScriptedHttpServer;
using TestSupport::ToolProcess;
using TestSupport::ToolResult;
using TestSupport::UUID;
using TestSupport::voice;

/** The different sizes of the Speex packets with sound in a request's body. */
std::set<std::size_t> soundPacketSizes(const std::string& body) {
    const std::size_t begin = std::min(body.find("OggS"), body.size());
    std::set<std::size_t> sizes;
    std::size_t packets = 0;
    for (const TestSupport::OggPage& page : TestSupport::readOggPages(
             {body.begin() + static_cast<std::ptrdiff_t>(begin), body.end()})) {
        for (const TestSupport::Bytes& packet : page.packets) {
            // The first two are the headers.
            if (packets++ >= 2) {
                sizes.insert(packet.size());
            }
        }
    }
    return sizes;
}

TEST(ToolRecognize, PrintsEveryEventAsAJsonLine) {
    ScriptedHttpServer server;
    server.script(
        {resultAnswer("<variant confidence=\"0.95\">go forward</variant>"
                      "<variant confidence=\"0.5\">go four</variant>")});
    const ToolResult result = runTalvox(recognize(server.getUrl(), {"--json"}), voice());
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err, "");

    const std::vector<std::string> events = lines(result.out);
    ASSERT_GE(events.size(), 6U) << result.out;
    EXPECT_THAT(events.front(), MatchesRegex("\\{\"event\":\"recordingBegin\",\"ms\":[0-9]+\\}"));
    EXPECT_THAT(events[events.size() - 2],
                MatchesRegex("\\{\"event\":\"recordingDone\",\"ms\":[0-9]+\\}"));
    EXPECT_THAT(events.back(),
                MatchesRegex("\\{\"event\":\"results\",\"ms\":[0-9]+,\"outcome\":\"accepted\","
                             "\"outcomeCode\":1,\"requestId\":\"request-7\",\"hypotheses\":\\["
                             "\\{\"text\":\"go forward\",\"confidence\":0\\.95\\},"
                             "\\{\"text\":\"go four\",\"confidence\":0\\.5\\}\\]\\}"));
    int speakingBegins = 0;
    int64_t lastMs = 0;
    for (std::size_t index = 0; index < events.size(); ++index) {
        const nlohmann::json event = nlohmann::json::parse(events[index]);
        EXPECT_GE(event["ms"].get<int64_t>(), lastMs);
        lastMs = event["ms"].get<int64_t>();
        if (index > 0 && index + 2 < events.size()) {
            EXPECT_THAT(events[index],
                        MatchesRegex("\\{\"event\":\"power\",\"ms\":[0-9]+,\"level\":-?[0-9.e-]+,"
                                     "\"silence\":(true|false)\\}"
                                     "|\\{\"event\":\"speakingBegin\",\"ms\":[0-9]+\\}"));
            speakingBegins += event["event"] == "speakingBegin" ? 1 : 0;
        }
    }
    EXPECT_EQ(speakingBegins, 1);
}

TEST(ToolRecognize, PrintsATableWithoutControlCharactersIntoAPipe) {
    ScriptedHttpServer server;
    server.script({resultAnswer("<variant confidence=\"0.3\">go forward</variant>")});
    const ToolResult result = runTalvox(recognize(server.getUrl(), {}), voice());
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.err, "");
    EXPECT_THAT(result.out, HasSubstr(" ms  recording, speak now\n"));
    EXPECT_THAT(result.out, HasSubstr(" ms  speech begins\n"));
    EXPECT_THAT(result.out, HasSubstr(" ms  recording done, waiting for the answer\n"));
    EXPECT_THAT(result.out, HasSubstr(" ms after the end of speech\n"));
    EXPECT_THAT(result.out, HasSubstr("  #  hypothesis  confidence\n  1  go forward  0.300\n"));
    EXPECT_THAT(result.out, EndsWith("\nverdict: rejected\nrequest: request-7\n"));
    EXPECT_EQ(result.out.find('\x1b'), std::string::npos);
    EXPECT_EQ(result.out.find('\r'), std::string::npos);
}

TEST(ToolRecognize, SendsWhatItsOptionsSay) {
    ScriptedHttpServer server;
    server.script({resultAnswer("<variant confidence=\"1\">a</variant>")});
    const ToolResult result = runTalvox(
        recognize(server.getUrl(), {"--streaming", "--format", "speex", "--quality", "4", "--lang",
                                    "tr-TR", "--model", "maps", "--session-id", "s-1", "--set",
                                    "myll=55.75,37.5", "--set", "language=uk-UA", "--json"}),
        voice());
    EXPECT_EQ(result.status, 0) << result.err;
    ASSERT_EQ(server.getRequestCount(), 1U);
    const ScriptedHttpServer::Request request = server.getRequest(0);
    EXPECT_EQ(request.line(), std::string("POST /asrgw_chunked?uuid=") + UUID +
                                  "&action=verbose&Content-Type=audio/x-speex&sessionId=s-1 "
                                  "HTTP/1.1");
    for (const char* part : {"tr-TR\r\n", "maps\r\n", "55.750000,37.500000\r\n", "OggS"}) {
        EXPECT_THAT(request.body, HasSubstr(part));
    }
    EXPECT_THAT(request.body, Not(HasSubstr("uk-UA")));
}

TEST(ToolRecognize, EncodesAtTheQualityThatItsOptionSays) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
    std::size_t count = 0;
    for (const char* const protocol : {"--streaming", "--no-streaming"}) {
        // 12,800 and 27,800 bits a second, in packets of 20 ms.
        for (const auto& [quality, packetSize] : {std::pair("4", 32U), std::pair("8", 70U)}) {
            const ToolResult result = runTalvox(
                recognize(server.getUrl(), {protocol, "--format", "speex", "--quality", quality}),
                voice());
            EXPECT_EQ(result.status, 0) << result.err;
            EXPECT_THAT(soundPacketSizes(server.getRequest(count++).body), ElementsAre(packetSize))
                << protocol << " --quality " << quality;
        }
    }
}

TEST(ToolRecognize, HasDefaultsOfItsOwn) {
    ScriptedHttpServer server;
    server.script({resultAnswer("<variant confidence=\"1\">a</variant>")});
    const ToolResult result = runTalvox({"recognize", "--file", "-", "--url", server.getUrl(),
                                         "--vad", QUICK_VAD, "--json", "--no-streaming"},
                                        voice());
    EXPECT_EQ(result.status, 0) << result.err;
    const ScriptedHttpServer::Request request = server.getRequest(0);
    EXPECT_THAT(request.line(), MatchesRegex("POST /asrgw\\?uuid=[0-9a-f]{32} HTTP/1\\.1"));
    EXPECT_THAT(request.body, HasSubstr("\r\nen-US\r\n"));
    EXPECT_THAT(request.body, HasSubstr("audio/x-pcm;bit=16;rate=16000"));
}

TEST(ToolRecognize, PlaysTheWholeFileAndDumpsWhatWasHeard) {
    const ScratchDirectory directory;
    ScriptedHttpServer server;
    server.script({resultAnswer("<variant confidence=\"1\">a</variant>")});
    const std::vector<int16_t> samples = TestSupport::voiceLike(16000, 0.6);
    const std::string path = directory.path("a.wav");
    ASSERT_TRUE(
        TestSupport::writeSoundFile(path, SF_FORMAT_WAV | SF_FORMAT_PCM_16, 16000, 1, samples));
    const ToolResult result =
        runTalvox({"recognize", "--file", path, "--url", server.getUrl(), "--uuid", UUID, "--vad",
                   QUICK_VAD, "--json", "--lead-in", "250", "--format", "pcm", "--dump",
                   directory.path(), "--events", directory.path("events")});
    EXPECT_EQ(result.status, 0) << result.err;
    const std::string sound = std::string(8000, '\0') + TestSupport::rawBytes(samples);
    const std::string dump = ScratchDirectory::read(directory.path("in.wav"));
    ASSERT_GT(dump.size(), 44 + sound.size());
    EXPECT_EQ(dump.substr(0, 4), "RIFF");
    EXPECT_TRUE(dump.compare(44, sound.size(), sound) == 0) << "the dump is not the sound played";
    EXPECT_TRUE(server.getRequest(0).body.find(sound) != std::string::npos)
        << "the sound did not arrive at the gateway";
    EXPECT_EQ(ScratchDirectory::read(directory.path("events")), result.out);
}

TEST(ToolRecognize, SaysWhenTheDumpIsNotComplete) {
    if (access("/dev/full", W_OK) != 0) {
        GTEST_SKIP() << "no /dev/full";
    }
    const ScratchDirectory directory;
    std::filesystem::create_symlink("/dev/full", directory.path("in.wav"));
    ScriptedHttpServer server;
    server.script({resultAnswer("<variant confidence=\"1\">a</variant>")});
    const ToolResult result =
        runTalvox(recognize(server.getUrl(), {"--json", "--dump", directory.path()}), voice());
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(lines(result.out).back(), HasSubstr("\"event\":\"results\""));
    EXPECT_EQ(result.err, "talvox: the dump " + directory.path("in.wav") + " is not complete\n");
}

TEST(ToolRecognize, EndsWithStatus1WhenNoMechanismMayServe) {
    const ToolResult result =
        runTalvox(recognize("http://127.0.0.1:1", {"--json", "--set", "asr=disabled"}), voice());
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(result.out, HasSubstr("\"code\":7,\"name\":\"ErrorNotAvailable\""));
}

TEST(ToolRecognize, LogsOnlyWhenAsked) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
    EXPECT_EQ(runTalvox(recognize(server.getUrl(), {}), voice()).err, "");
    const ToolResult verbose = runTalvox(recognize(server.getUrl(), {"--verbosity", "2"}), voice());
    EXPECT_EQ(verbose.status, 0);
    EXPECT_THAT(verbose.err, HasSubstr("talvox: createRecognizer called\n"));
    EXPECT_THAT(verbose.err, HasSubstr("talvox: Request request-7 finished in "));
}

TEST(ToolRecognize, RepairsWhatADocumentSaysBeyondRange) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
    const ScratchDirectory directory;
    const std::string file =
        directory.write("settings.xml",
                        "<startup><features><voice><samplerate>96000</samplerate>"
                        "<language>tr-TR</language></voice></features></startup>");
    const ToolResult result =
        runTalvox(recognize(server.getUrl(), {"--json", "--settings", file}), voice());
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.err,
              "talvox: TalvoxSettings::validate: bad sampleRate: 96000, setting to default\n");
    ASSERT_EQ(server.getRequestCount(), 1U);
    EXPECT_THAT(server.getRequest(0).body, HasSubstr("tr-TR\r\n"));
}

TEST(ToolRecognize, CtrlCCancels) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::never());
    for (const int number : {SIGINT, SIGTERM}) {
        ToolProcess process(TALVOX_BINARY, recognize(server.getUrl(), {"--json", "--streaming"}),
                            voice());
        EXPECT_THAT(process.waitForLine("recordingBegin"), Not(std::string()));
        process.signal(number);
        const ToolResult result = process.wait();
        EXPECT_EQ(result.status, 1);
        EXPECT_THAT(lines(result.out).back(),
                    MatchesRegex("\\{\"event\":\"error\",\"ms\":[0-9]+,\"code\":5,"
                                 "\"name\":\"ErrorCanceled\",\"reason\":\"the application "
                                 "cancelled\"\\}"));
        EXPECT_EQ(result.err,
                  "talvox: recognition ended with ErrorCanceled: the application cancelled\n");
    }
}

TEST(ToolRecognize, CtrlCCancelsWhileTheAnswerIsAwaited) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(Answer::never());
    ToolProcess process(TALVOX_BINARY, recognize(server.getUrl(), {"--json"}), voice());
    EXPECT_THAT(process.waitForLine("recordingDone"), Not(std::string()));
    process.signal(SIGINT);
    const ToolResult result = process.wait();
    EXPECT_EQ(result.status, 1);
    EXPECT_THAT(lines(result.out).back(), HasSubstr("ErrorCanceled"));
}

TEST(ToolRecognize, RunsToItsEndWhenNobodyReadsItsOutput) {
    ScriptedHttpServer server;
    server.setDefaultAnswer(resultAnswer("<variant confidence=\"1\">a</variant>"));
    const ScratchDirectory directory;
    const std::string sound = directory.write("a.raw", voice());
    std::string command = std::string(TALVOX_BINARY) + " recognize --file - --json --url " +
                          server.getUrl() + " --vad '" + QUICK_VAD + "' < " + sound + " 2>" +
                          directory.path("err") + " | true; exit ${PIPESTATUS[0]}";
    ToolProcess process("/bin/bash", {"-c", command});
    EXPECT_EQ(process.wait().status, 0);
    EXPECT_EQ(ScratchDirectory::read(directory.path("err")), "");
    EXPECT_EQ(server.getRequestCount(), 1U);
}

}  // namespace
