#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <string>

#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/RecordedSpeech.h"
#include "gateway/SpeechModel.h"
#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace {

/** Four words that sound like those of a recording and are spelt otherwise. */
constexpr const char* DICTIONARY =
    "geh G OW\n"
    "meter M IY T ER Z\n"
    "vorwaerts F AO R W ER D\n"
    "zehn T EH N\n";

constexpr const char* LANGUAGE_MODEL =
    "\\data\\\n"
    "ngram 1=6\n"
    "ngram 2=5\n"
    "\n"
    "\\1-grams:\n"
    "-0.7782 <s> -0.3010\n"
    "-0.7782 </s>\n"
    "-0.7782 geh -0.3010\n"
    "-0.7782 meter -0.3010\n"
    "-0.7782 vorwaerts -0.3010\n"
    "-0.7782 zehn -0.3010\n"
    "\n"
    "\\2-grams:\n"
    "-0.3010 <s> geh\n"
    "-0.3010 geh vorwaerts\n"
    "-0.3010 meter </s>\n"
    "-0.3010 vorwaerts zehn\n"
    "-0.3010 zehn meter\n"
    "\n"
    "\\end\\\n";

/** The port out of the line in which the program says that it is ready; 0 without one. */
uint16_t readPort(TestSupport::ChildProcess& program) {
    const std::string start = "listening on http://127.0.0.1:";
    std::string output;
    for (std::string piece = program.read(); !piece.empty(); piece = program.read()) {
        output += piece;
        const std::size_t begin = output.find(start);
        if (begin != std::string::npos && output.find('\n', begin) != std::string::npos) {
            return static_cast<uint16_t>(std::stoi(output.substr(begin + start.size())));
        }
    }
    return 0;
}

GatewayTest::HttpAnswer recognise(uint16_t port, const std::string& language) {
    const std::string body =
        GatewayTest::bodyWithSound(GatewayTest::toPcm(GatewayTest::readRecording("goforward.raw")),
                                   GatewayTest::PCM16K, language);
    GatewayTest::HttpClient client(port);
    client.send(GatewayTest::requestHead("/asrgw?uuid=u1", static_cast<long>(body.size())) + body);
    return client.read();
}

}  // namespace

TEST(GatewayProgram, RecognisesWithTheModelThatItIsGiven) {
    const TestSupport::ScratchDirectory directory;
    std::filesystem::create_directory_symlink(Gateway::SpeechModel().acousticDir,
                                              directory.path("acoustic"));
    TestSupport::ChildProcess program({GATEWAY_BINARY, "--port", "0", "--model-dir",
                                       directory.path("acoustic"), "--lm",
                                       directory.write("model.lm", LANGUAGE_MODEL), "--dict",
                                       directory.write("model.dict", DICTIONARY), "--lang", "de"});
    const uint16_t port = readPort(program);
    ASSERT_NE(0, port);
    const std::string answer = recognise(port, "de-DE").body;
    EXPECT_NE(std::string::npos, answer.find("\">geh vorwaerts zehn meter</variant>")) << answer;
    const GatewayTest::HttpAnswer other = recognise(port, "en-US");
    EXPECT_EQ(400, other.status);
    EXPECT_EQ("the language en-US is not available; this gateway recognises de\n", other.body);
    program.sendSignal(SIGTERM);
    EXPECT_EQ(0, program.wait());
}

TEST(GatewayProgram, MissesTheFilesOfTheModelThatItIsGiven) {
    const TestSupport::ScratchDirectory directory;
    const std::string nowhere = directory.path("nowhere");
    for (const char* option : {"--model-dir", "--lm", "--dict"}) {
        const TestSupport::ChildProcess::Result result =
            TestSupport::ChildProcess::run({GATEWAY_BINARY, "--port", "0", option, nowhere});
        EXPECT_EQ(1, result.exitStatus) << option;
        EXPECT_NE(std::string::npos,
                  result.output.find("talvox-gateway: cannot read the model's file " + nowhere))
            << option << result.output;
    }
}
