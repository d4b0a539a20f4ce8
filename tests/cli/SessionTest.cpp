// A session of the tool's on the hand-driven clock: exact times.
#include "cli/Session.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <future>
#include <vector>

#include "SoundFiles.h"
#include "core/sound/FileRecorder.h"
#include "core/sound/Recorder.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/LogCapture.h"
#include "support/ScriptedHttpServer.h"

namespace {

using Cli::SessionEvent;
using TestSupport::Answer;
using TestSupport::ScriptedHttpServer;

const int64_t MS = 1000000;

class Recording : public Cli::EventPrinter {
  public:
    void print(const SessionEvent& event) override { events.push_back(event); }

    /** When an event of this kind first happened; -1 when it did not. */
    int64_t firstMs(SessionEvent::Kind kind) const {
        for (const SessionEvent& event : events) {
            if (event.kind == kind) {
                return event.ms;
            }
        }
        return -1;
    }

    /** Of each level, whether its buffer was digital silence. */
    std::vector<bool> silences() const {
        std::vector<bool> found;
        for (const SessionEvent& event : events) {
            if (event.kind == SessionEvent::POWER) {
                found.push_back(event.isSilence);
            }
        }
        return found;
    }

    std::vector<SessionEvent> events;
};

class SessionTest : public ::testing::Test {
  protected:
    void SetUp() override { kdUseManualClockKOR(1000 * MS); }
    void TearDown() override {
        Sound::Recorder::setFactory({});
        kdUseRealClockKOR();
    }

    boost::shared_ptr<Talvox::Settings> makeSettings() const {
        auto settings = boost::make_shared<Talvox::Settings>();
        settings->putString(Talvox::Settings::SKS_URL, server.getUrl());
        settings->putString(Talvox::Settings::SKS_UUID, std::string(32, 'a'));
        return settings;
    }

    /** Starts the session on a thread of its own; returns once recording runs. */
    std::future<SessionEvent> start(Cli::Session& session, const std::vector<int16_t>& samples) {
        std::promise<void> asked;
        Sound::Recorder::setFactory([&asked, samples] {
            asked.set_value();
            return boost::make_shared<Sound::FileRecorder>(samples);
        });
        std::future<SessionEvent> last =
            std::async(std::launch::async, [this, &session] { return session.run(recording); });
        asked.get_future().get();
        // The recorder is made in the middle of the start, which holds the lock to its end.
        const Util::EventLock lock;
        return last;
    }

    static void playTo(int64_t ms) {
        while (kdGetTimeUST() < (1000 + ms) * MS) {
            kdAdvanceClockKOR(100 * MS);
        }
    }

    TestSupport::LogCapture log;
    ScriptedHttpServer server;
    Recording recording;
};

TEST_F(SessionTest, TellsEveryEventWithItsTime) {
    server.setDefaultAnswer(Answer::status(200).held());
    std::vector<int16_t> samples(4800, 0);
    const std::vector<int16_t> voice = TestSupport::voiceLike(16000, 1);
    samples.insert(samples.end(), voice.begin(), voice.end());
    Cli::Session session(makeSettings());
    std::future<SessionEvent> last = start(session, samples);
    playTo(6000);
    server.release();

    EXPECT_EQ(last.get().kind, SessionEvent::FAILURE);
    EXPECT_EQ(recording.events.back().errorCode, 3);
    EXPECT_EQ(recording.events.back().ms, 6000);
    EXPECT_EQ(recording.firstMs(SessionEvent::RECORDING_BEGIN), 220);
    EXPECT_EQ(recording.firstMs(SessionEvent::POWER), 320);
    const int64_t began = recording.firstMs(SessionEvent::SPEAKING_BEGIN);
    EXPECT_GE(began, 500);
    EXPECT_LE(began, 900);
    const int64_t done = recording.firstMs(SessionEvent::RECORDING_DONE);
    EXPECT_GE(done, 1700);
    EXPECT_LE(done, 2500);
    EXPECT_EQ(done % 100, 20);
    // After the noise there is one more buffer of zeros, then a second of voice, then zeros.
    const std::vector<bool> silences = recording.silences();
    ASSERT_GT(silences.size(), 12U);
    EXPECT_EQ(std::vector<bool>(silences.begin(), silences.begin() + 12),
              (std::vector<bool>{true, false, false, false, false, false, false, false, false,
                                 false, false, true}));
}

TEST_F(SessionTest, EndsWithNoVoiceAfterFiveSeconds) {
    Cli::Session session(makeSettings());
    std::future<SessionEvent> last = start(session, {});
    playTo(5100);
    const SessionEvent event = last.get();
    EXPECT_EQ(event.kind, SessionEvent::FAILURE);
    EXPECT_EQ(event.errorCode, 6);
    EXPECT_EQ(event.ms, 5020);
    EXPECT_TRUE(log.contains("Recognizer error: 6, ErrorNoVoice"));
}

TEST_F(SessionTest, AnInterruptCancels) {
    Cli::Session session(makeSettings());
    std::future<SessionEvent> last = start(session, {});
    playTo(1000);
    session.interrupt();
    const SessionEvent event = last.get();
    EXPECT_EQ(event.kind, SessionEvent::FAILURE);
    EXPECT_EQ(event.errorCode, 5);
    EXPECT_EQ(event.ms, 1000);
}

TEST_F(SessionTest, AnInterruptBeforeTheStartCancelsToo) {
    Cli::Session session(makeSettings());
    session.interrupt();
    std::future<SessionEvent> last = start(session, {});
    EXPECT_EQ(last.get().errorCode, 5);
}

TEST_F(SessionTest, ASecondSessionMayFollow) {
    for (int round = 0; round < 2; ++round) {
        Cli::Session session(makeSettings());
        std::future<SessionEvent> last = start(session, {});
        session.interrupt();
        EXPECT_EQ(last.get().errorCode, 5);
    }
}

}  // namespace
