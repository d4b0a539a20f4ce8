// Mistakes in settings, and what a session makes of them: a report or a repair, one terminal event,
// and a next session that works.
#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <limits>
#include <string>
#include <tuple>
#include <vector>

#include "SessionTest.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"

namespace {

using CloudTest::SHORT_SPEECH;
using CloudTest::Texts;
using Talvox::Settings;
using ::testing::ElementsAre;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::LogCapture;

const AssertReport EMPTY_LANGUAGE{"!recognizerSettings.getLanguage().empty()",
                                  "talvox/impl/RecognizeRequest", 170};
const AssertReport UNKNOWN_ENGINE{"aValue == \"buffered\"", "talvox/impl/BufferedVAD", 174};

/** Counts what a listener hears after its terminal event. */
class SettingsMistakesTest : public CloudTest::SessionTest {
  protected:
    ~SettingsMistakesTest() override {
        // The listener's hook is this object's, and may run at this moment.
        const Util::EventLock lock;
        session.reset();
    }

    void startWith(const boost::shared_ptr<Settings>& recognizerSettings) {
        events = boost::make_shared<CloudTest::EventRecorder>();
        eventsAfterEnd = 0;
        events->hook = [this](const std::string& /*text*/, Talvox::Recognizer*) {
            eventsAfterEnd += isOver ? 1 : 0;
            isOver = events->countEnds() > 0;
        };
        isOver = false;
        session = engine().createRecognizer(events, recognizerSettings);
        session->start();
    }

    /** Gives a session that is over every chance to say something more. */
    void expectSilenceAfterOneEnd() {
        play(1000);
        session->stop();
        session->cancel();
        advanceMs(60000);
        kdDrainEventsKOR();
        EXPECT_EQ(events->countEnds(), 1U);
        EXPECT_EQ(eventsAfterEnd, 0);
        EXPECT_TRUE(isEngineFree());
    }

    int eventsAfterEnd = 0;

  private:
    bool isOver = false;
};

/** Streaming, sound format, the policy that leads to the cloud recognizer, and from where. */
class EmptyLanguageTest
    : public SettingsMistakesTest,
      public ::testing::WithParamInterface<std::tuple<bool, const char*, const char*, bool>> {
  protected:
    EmptyLanguageTest() {
        configure([](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, std::get<0>(GetParam()));
            settings.putString(Settings::SKS_SOUND_FORMAT, std::get<1>(GetParam()));
            settings.putString(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
        });
    }

    static boost::shared_ptr<Settings> makeSettings() {
        auto settings = boost::make_shared<Settings>();
        settings->putString(Settings::RS_ASR_POLICY, std::get<2>(GetParam()));
        return settings;
    }

    static boost::shared_ptr<Settings> makeBadSettings() {
        auto settings = makeSettings();
        if (std::get<3>(GetParam())) {
            settings->updateFromXml("<voice><language/></voice>", "voice", Settings::bundleSpecs);
        } else {
            settings->putString(Settings::RS_LANGUAGE, "");
        }
        EXPECT_EQ(settings->getLanguage(), "");
        return settings;
    }
};

TEST_P(EmptyLanguageTest, EndsInOneErrorAndNoSoundLeavesTheDevice) {
    {
        const AssertCapture asserts;
        const LogCapture log;
        startWith(makeBadSettings());
        play(1100);
        ASSERT_TRUE(events->waitForEnds());
        expectSilenceAfterOneEnd();
        EXPECT_EQ(events->texts().back(), "error ErrorNetwork");
        EXPECT_EQ(session->getErrorReason(), "the request cannot be sent: the language is empty");
        EXPECT_FALSE(recorder->isRecording());
        EXPECT_THAT(asserts.reports(), ElementsAre(EMPTY_LANGUAGE));
        EXPECT_EQ(log.count("Network: a request cannot be sent: the language is empty"), 1U);
    }
    EXPECT_EQ(server.getConnectionCount(), 0U);

    startWith(makeSettings());
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts(),
              (Texts{"recordingBegin", "speakingBegin", "recordingDone", "results"}));
    EXPECT_EQ(server.getRequestCount(), 1U);
}

INSTANTIATE_TEST_SUITE_P(Ways, EmptyLanguageTest,
                         ::testing::Combine(::testing::Bool(), ::testing::Values("pcm", "speex"),
                                            ::testing::Values("korvel_only", "platform_first"),
                                            ::testing::Bool()));

class UnknownEngineTest : public SettingsMistakesTest, public ::testing::WithParamInterface<bool> {
  protected:
    /** @return each event with its time since the start */
    std::vector<std::string> recognise(const std::string& vad) {
        configure([&vad](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, GetParam());
            settings.putString(Settings::SKS_VAD_SETTINGS, vad);
        });
        startWith(boost::make_shared<Settings>());
        play(1100);
        EXPECT_TRUE(events->waitForEnds());
        std::vector<std::string> heard;
        for (const std::string& text : events->texts()) {
            heard.push_back(text + " at " + std::to_string(events->timeOf(text)));
        }
        return heard;
    }
};

TEST_P(UnknownEngineTest, IsReportedAndTheDefaultDetectorServesToTheEnd) {
    const std::vector<std::string> expected = recognise(SHORT_SPEECH);
    expectSilenceAfterOneEnd();
    const AssertCapture asserts;
    const LogCapture log;
    EXPECT_EQ(recognise(std::string("engine=ears;") + SHORT_SPEECH), expected);
    EXPECT_EQ(events->texts(),
              (Texts{"recordingBegin", "speakingBegin", "recordingDone", "results"}));
    EXPECT_THAT(asserts.reports(), ElementsAre(UNKNOWN_ENGINE));
    EXPECT_EQ(log.count("Unknown engine name for VoiceActivityDetector: ears"), 1U);
    expectSilenceAfterOneEnd();
    EXPECT_EQ(server.getRequestCount(), 2U);
}

INSTANTIATE_TEST_SUITE_P(SimpleAndChunked, UnknownEngineTest, ::testing::Bool());

TEST_F(SettingsMistakesTest, ShippedLibraryLogsTheReportAndTheSessionGoesOn) {
    const TestSupport::DefaultAssertionHandler shipped;
    const LogCapture log;
    const KDint64 before = kdGetAssertionCountKOR();
    configureText(Settings::SKS_VAD_SETTINGS, std::string("engine=ears;") + SHORT_SPEECH);
    startWith(boost::make_shared<Settings>());
    play(1100);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
    EXPECT_EQ(kdGetAssertionCountKOR(), before + 1);
    EXPECT_EQ(log.count("assertion failed: aValue == \"buffered\" (talvox/impl/BufferedVAD:174)"),
              1U);
}

Util::Bundle::Elem makeElem(Util::Bundle::ElemType type) {
    Util::Bundle::Elem elem;
    elem.type = type;
    return elem;
}

/** A value of another type under each key, in the engine's and in the recognizer's settings. */
TEST_F(SettingsMistakesTest, ValuesOfAnotherTypeAreReportedAndEndInOneEvent) {
    const boost::shared_ptr<const Settings> good = engine().getTalvoxSettings();
    for (const std::string& key : good->getKeys()) {
        for (int type = Util::Bundle::BOOLEAN; type <= Util::Bundle::BUNDLE; ++type) {
            if (good->getType(key) == type) {
                continue;
            }
            SCOPED_TRACE(key + " as type " + std::to_string(type));
            const auto settings = good->clone();
            settings->putInt(Settings::SKS_VERBOSE_LEVEL, 2);
            settings->putString(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
            settings->put(key, makeElem(static_cast<Util::Bundle::ElemType>(type)));
            const AssertCapture asserts;
            const LogCapture log;
            engine().setTalvoxSettings(settings);
            startWith(settings);
            play(1100);
            session->cancel();
            expectSilenceAfterOneEnd();
        }
    }
}

/** The engine's own settings are taken as they are. */
TEST_F(SettingsMistakesTest, NoSampleRateEndsTheProcess) {
    for (const int rate : {0, -1, 1, 7, 999, 48001, std::numeric_limits<int>::max(),
                           std::numeric_limits<int>::min()}) {
        for (const char* format : {"pcm", "speex"}) {
            SCOPED_TRACE(std::string(format) + " at " + std::to_string(rate));
            configure([&](Settings& settings) {
                settings.putInt(Settings::SKS_SAMPLE_RATE, rate);
                settings.putString(Settings::SKS_SOUND_FORMAT, format);
            });
            const LogCapture log;
            startWith(boost::make_shared<Settings>());
            play(1100);
            session->cancel();
            expectSilenceAfterOneEnd();
        }
    }
}

TEST_F(SettingsMistakesTest, NothingAtAllIsReportedAndServedWithTheDefaults) {
    configureText(Settings::SKS_VAD_SETTINGS, SHORT_SPEECH);
    const AssertCapture asserts;
    const auto silent = engine().createRecognizer(nullptr, nullptr);
    ASSERT_TRUE(silent);
    EXPECT_EQ(silent->getSettings()->getLanguage(), "ru-RU");
    silent->start();
    play(1100);
    ASSERT_TRUE(server.waitForRequest(1));
    engine().setTalvoxSettings(nullptr);
    ASSERT_TRUE(engine().getTalvoxSettings());
    EXPECT_EQ(engine().getTalvoxSettings()->getUuid(), CloudTest::UUID);
    ASSERT_EQ(asserts.count(), 2U);
    for (const AssertReport& report : asserts.reports()) {
        EXPECT_EQ(report.condition, "settings");
        EXPECT_EQ(report.path, "talvox/Talvox");
    }
}

TEST_F(SettingsMistakesTest, ABufferThatIsNoneIsReportedAndLeftOut) {
    startSession(SHORT_SPEECH);
    play(300);
    {
        const AssertCapture asserts;
        recorder->deliver(nullptr);
        ASSERT_EQ(asserts.count(), 1U);
        EXPECT_EQ(asserts.reports()[0].condition, "buffer");
        EXPECT_EQ(asserts.reports()[0].path, "core/src/sound/Recorder");
    }
    play(900);
    ASSERT_TRUE(events->waitForEnds());
    EXPECT_EQ(events->texts().back(), "results");
}

}  // namespace
