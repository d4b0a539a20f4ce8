// The real gateway behind a connection that breaks while the user speaks.
#include <gtest/gtest.h>

#include <csignal>

#include "CuttingRelay.h"
#include "RecordedSession.h"
#include "pal/kd.h"
#include "support/ChildProcess.h"
#include "talvox/Settings.h"

namespace FaultTest {

namespace {

using Talvox::Settings;

class RelayedRecognition : public RecordedSession,
                           public ::testing::WithParamInterface<std::string> {
  protected:
    /** Starts the gateway. @return its port */
    static unsigned short readPort(TestSupport::ChildProcess& gateway) {
        const std::string start = "listening on http://127.0.0.1:";
        std::string output;
        for (std::string piece = gateway.read(); !piece.empty(); piece = gateway.read()) {
            output += piece;
            const std::size_t begin = output.find(start);
            if (begin != std::string::npos && output.find('\n', begin) != std::string::npos) {
                return static_cast<unsigned short>(std::stoi(output.substr(begin + start.size())));
            }
        }
        return 0;
    }
};

TEST_P(RelayedRecognition, HearsTheWholeUtterance) {
    if (sound.empty()) {
        GTEST_SKIP() << "needs the package pocketsphinx-testdata";
    }
    TestSupport::ChildProcess gateway({GATEWAY_BINARY, "--port", "0"});
    const unsigned short port = readPort(gateway);
    ASSERT_NE(0, port);
    const bool encoded = GetParam() == Settings::SOUND_FORMAT_SPEEX;
    {
        CuttingRelay relay(port, encoded ? 3000 : 32000);
        setChunked(true);
        configureText(Settings::SKS_SOUND_FORMAT, GetParam());
        startSession(relay.getUrl());
        playTo(sound.size() / 2);
        // Only half of it has been said.
        ASSERT_TRUE(relay.waitForCut());
        playTo(sound.size());
        session->stop();
        // Not beyond the time that the answer may take.
        for (int i = 0; i < 150 && !relay.waitForConnections(2, 20); ++i) {
            advanceMs(BUFFER_MS);
        }
        ASSERT_TRUE(relay.waitForConnections(2, 0));
        ASSERT_TRUE(events->waitForEnds(1, std::chrono::seconds(60)));
        ASSERT_EQ("results", events->texts().back()) << ::testing::PrintToString(log->messages());
        ASSERT_FALSE(events->recognition()->getResults()->empty())
            << ::testing::PrintToString(log->messages());
        EXPECT_EQ(RECORDED_WORDS, events->recognition()->getResults()->front().getText());
        session.reset();
        kdDrainEventsKOR();
    }
    gateway.sendSignal(SIGTERM);
    EXPECT_EQ(0, gateway.wait());
}

INSTANTIATE_TEST_SUITE_P(Formats, RelayedRecognition,
                         ::testing::Values(Settings::SOUND_FORMAT_PCM,
                                           Settings::SOUND_FORMAT_SPEEX),
                         [](const ::testing::TestParamInfo<std::string>& parameters) {
                             return parameters.param;
                         });

}  // namespace

}  // namespace FaultTest
