#include "talvox/Talvox.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <atomic>
#include <boost/make_shared.hpp>
#include <condition_variable>
#include <mutex>
#include <thread>

#include "RecordingListener.h"
#include "core/util/EventLock.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "support/PrivateMember.h"
#include "talvox/DummyRecognizer.h"
#include "talvox/Log.h"
#include "talvox/impl/KorvelRecognizer.h"

using Talvox::DummyRecognizer;
using Talvox::KorvelRecognizer;
using Talvox::Recognizer;
using Talvox::Settings;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Not;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using TestSupport::RecordingListener;
using Engine = Talvox::Talvox;

namespace TestSupport {

struct EngineSettings {
    using Type = boost::shared_ptr<const Settings> Engine::*;
    friend Type memberOf(EngineSettings);
};
template struct PrivateMember<EngineSettings, &Talvox::Talvox::talvoxSettings>;

}  // namespace TestSupport

namespace {

class TalvoxTest : public ::testing::Test {
  protected:
    TalvoxTest() : engine(Engine::getInstance()) {}
    ~TalvoxTest() override { engine.setTalvoxSettings(boost::make_shared<Settings>()); }

    boost::shared_ptr<Recognizer> dummy() const {
        return boost::make_shared<DummyRecognizer>(&engine, engine.getTalvoxSettings());
    }

    void setVerbosity(int verbosity) {
        const auto settings = engine.getTalvoxSettings()->clone();
        settings->putInt(Settings::SKS_VERBOSE_LEVEL, verbosity);
        engine.setTalvoxSettings(settings);
    }

    Engine& engine;
};

boost::shared_ptr<Settings> completeSettings() {
    auto settings = boost::make_shared<Settings>();
    settings->putString(Settings::SKS_URL, "http://127.0.0.1:8090");
    settings->putString(Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    return settings;
}

/** Lets several threads begin at once. */
class Gate {
  public:
    void wait() {
        std::unique_lock<std::mutex> lock(mutex);
        opened.wait(lock, [this] { return isOpen; });
    }
    void open() {
        const std::lock_guard<std::mutex> lock(mutex);
        isOpen = true;
        opened.notify_all();
    }

  private:
    std::mutex mutex;
    std::condition_variable opened;
    bool isOpen = false;
};

}  // namespace

TEST_F(TalvoxTest, HasAVersion) {
    EXPECT_EQ("133", Engine::VERSION);
}

TEST_F(TalvoxTest, IsOnePerProcess) {
    EXPECT_EQ(&engine, &Engine::getInstance());
}

TEST(TalvoxSingleton, BeginsAnewWithDefaultsAfterItWasDestroyed) {
    const auto settings = boost::make_shared<Settings>();
    settings->putInt(Settings::SKS_VERBOSE_LEVEL, 5);
    Engine::getInstance().setTalvoxSettings(settings);
    Util::SingletonStorage::destroyAll();
    EXPECT_EQ(Settings().toXmlString("s"),
              Engine::getInstance().getTalvoxSettings()->toXmlString("s"));
}

TEST_F(TalvoxTest, NewSettingsReplaceTheOldOnesWithoutChangingThem) {
    const auto old = engine.getTalvoxSettings();
    const auto settings = old->clone();
    settings->putString(Settings::SKS_URL, "http://127.0.0.1");
    engine.setTalvoxSettings(settings);
    EXPECT_EQ(settings, engine.getTalvoxSettings());
    EXPECT_EQ("", old->getUrl());
}

TEST_F(TalvoxTest, SettingsAreInstalledAsTheyAre) {
    const auto settings = boost::make_shared<Settings>();
    settings->putInt(Settings::SKS_SPEEX_QUALITY, 20);
    const LogCapture log;
    engine.setTalvoxSettings(settings);
    EXPECT_EQ(20, engine.getTalvoxSettings()->getInt(Settings::SKS_SPEEX_QUALITY));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(TalvoxTest, MissingSettingsAreABrokenInvariantAndChangeNothing) {
    const auto old = engine.getTalvoxSettings();
    const AssertCapture asserts;
    engine.setTalvoxSettings(nullptr);
    EXPECT_EQ(1U, asserts.count());
    EXPECT_EQ(old, engine.getTalvoxSettings());
}

TEST_F(TalvoxTest, WithoutSettingsOfItsOwnTheEngineReportsThatAndGivesTheDefaults) {
    auto& slot = engine.*memberOf(TestSupport::EngineSettings());
    const boost::shared_ptr<const Settings> old = std::exchange(slot, nullptr);
    const AssertCapture asserts;
    const boost::shared_ptr<const Settings> given = engine.getTalvoxSettings();
    slot = old;
    ASSERT_EQ(1U, asserts.count());
    EXPECT_EQ("talvoxSettings", asserts.reports()[0].condition);
    EXPECT_EQ("talvox/Talvox", asserts.reports()[0].path);
    ASSERT_TRUE(given);
    EXPECT_TRUE(given->conformsTo(Settings::bundleSpecs));
}

TEST_F(TalvoxTest, SettingsMayBeReadWhileTheyAreReplaced) {
    constexpr int ROUNDS = 500;
    Gate gate;
    std::thread writer([&] {
        gate.wait();
        for (int i = 0; i < ROUNDS; ++i) {
            const auto settings = boost::make_shared<Settings>();
            settings->putInt(Settings::SKS_SPEEX_QUALITY, i);
            settings->putInt(Settings::SKS_SAMPLE_RATE, i);
            engine.setTalvoxSettings(settings);
        }
    });
    engine.setTalvoxSettings([] {
        auto settings = boost::make_shared<Settings>();
        settings->putInt(Settings::SKS_SPEEX_QUALITY, 0);
        settings->putInt(Settings::SKS_SAMPLE_RATE, 0);
        return settings;
    }());
    gate.open();
    for (int i = 0; i < ROUNDS; ++i) {
        const auto settings = engine.getTalvoxSettings();
        EXPECT_EQ(settings->getInt(Settings::SKS_SPEEX_QUALITY), settings->getSampleRate());
    }
    writer.join();
    EXPECT_EQ(ROUNDS - 1, engine.getTalvoxSettings()->getSampleRate());
}

TEST_F(TalvoxTest, AdmitsOneRecognizerAtATime) {
    const auto first = dummy();
    const auto second = dummy();
    EXPECT_TRUE(engine.registerRecognizer(first.get()));
    EXPECT_FALSE(engine.registerRecognizer(second.get()));
    EXPECT_FALSE(engine.registerRecognizer(first.get()));
    engine.unregisterRecognizer(first.get());
    EXPECT_TRUE(engine.registerRecognizer(second.get()));
    engine.unregisterRecognizer(second.get());
}

TEST_F(TalvoxTest, UnregisteringAnotherRecognizerKeepsTheActiveOne) {
    const auto active = dummy();
    const auto other = dummy();
    ASSERT_TRUE(engine.registerRecognizer(active.get()));
    engine.unregisterRecognizer(other.get());
    EXPECT_FALSE(engine.registerRecognizer(other.get()));
    engine.unregisterRecognizer(active.get());
    engine.unregisterRecognizer(active.get());
    EXPECT_TRUE(engine.registerRecognizer(other.get()));
    engine.unregisterRecognizer(other.get());
}

TEST_F(TalvoxTest, TwoThreadsNeverBothBecomeActive) {
    constexpr int ROUNDS = 2000;
    Gate gate;
    std::atomic<int> active{0};
    std::atomic<int> admitted{0};
    std::atomic<bool> overlap{false};
    const auto compete = [&](Recognizer* recognizer) {
        gate.wait();
        for (int i = 0; i < ROUNDS; ++i) {
            if (!engine.registerRecognizer(recognizer)) {
                continue;
            }
            if (active.fetch_add(1) != 0) {
                overlap = true;
            }
            ++admitted;
            active.fetch_sub(1);
            engine.unregisterRecognizer(recognizer);
        }
    };
    const auto first = dummy();
    const auto second = dummy();
    std::thread one(compete, first.get());
    std::thread two(compete, second.get());
    gate.open();
    one.join();
    two.join();
    EXPECT_FALSE(overlap);
    // The very first attempt meets no other.
    EXPECT_GE(admitted, 1);
    EXPECT_TRUE(engine.registerRecognizer(first.get()));
    engine.unregisterRecognizer(first.get());
}

TEST_F(TalvoxTest, OfTwoThreadsThatRegisterOnceExactlyOneIsAdmitted) {
    for (int round = 0; round < 50; ++round) {
        Gate gate;
        const auto first = dummy();
        const auto second = dummy();
        std::atomic<int> admitted{0};
        const auto compete = [&](Recognizer* recognizer) {
            gate.wait();
            admitted += engine.registerRecognizer(recognizer) ? 1 : 0;
        };
        std::thread one(compete, first.get());
        std::thread two(compete, second.get());
        gate.open();
        one.join();
        two.join();
        EXPECT_EQ(1, admitted);
        engine.unregisterRecognizer(first.get());
        engine.unregisterRecognizer(second.get());
    }
}

TEST_F(TalvoxTest, UnregisteringNothingLeavesTheActiveRecognizer) {
    const auto active = dummy();
    const auto other = dummy();
    ASSERT_TRUE(engine.registerRecognizer(active.get()));
    engine.unregisterRecognizer(nullptr);
    EXPECT_FALSE(engine.registerRecognizer(other.get()));
    engine.unregisterRecognizer(active.get());
    engine.unregisterRecognizer(nullptr);
    EXPECT_TRUE(engine.registerRecognizer(other.get()));
    engine.unregisterRecognizer(other.get());
}

TEST_F(TalvoxTest, MakesTheRecognizerThatTheSettingsAskFor) {
    const auto settings = completeSettings();
    EXPECT_TRUE(
        boost::dynamic_pointer_cast<KorvelRecognizer>(engine.createRecognizer(nullptr, settings)));
    settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_DISABLED);
    EXPECT_TRUE(
        boost::dynamic_pointer_cast<DummyRecognizer>(engine.createRecognizer(nullptr, settings)));
}

TEST_F(TalvoxTest, GivesTheRecognizerAValidatedCopyAndLeavesTheCallersSettingsAlone) {
    const auto settings = completeSettings();
    settings->putInt(Settings::SKS_SPEEX_QUALITY, 20);
    engine.setTalvoxSettings(settings->clone());
    const LogCapture log;
    const auto recognizer = engine.createRecognizer(nullptr, settings);
    EXPECT_EQ(20, settings->getInt(Settings::SKS_SPEEX_QUALITY));
    EXPECT_EQ(10, recognizer->getSettings()->getInt(Settings::SKS_SPEEX_QUALITY));
    EXPECT_EQ(&engine, recognizer->getEngine());
    EXPECT_THAT(
        log.messages(),
        ElementsAre(
            "TalvoxSettings::validate: bad speexQuality: 20, setting to default",
            "policyOverride default policy korvel_only, platformSupported 0 choosing Korvel"));
}

TEST_F(TalvoxTest, TheRecognizerReportsToTheListener) {
    const auto settings = completeSettings();
    settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_DISABLED);
    const auto listener = boost::make_shared<RecordingListener>();
    const auto recognizer = engine.createRecognizer(listener, settings);
    EXPECT_THAT(listener->errors, IsEmpty());
    recognizer->start();
    EXPECT_THAT(listener->errors, ElementsAre(7));
}

TEST_F(TalvoxTest, TheRecognizerDoesNotKeepTheListener) {
    auto listener = boost::make_shared<RecordingListener>();
    const boost::weak_ptr<RecordingListener> watch(listener);
    const auto recognizer = engine.createRecognizer(listener, completeSettings());
    listener.reset();
    EXPECT_TRUE(watch.expired());
}

TEST_F(TalvoxTest, MakingARecognizerRegistersNothing) {
    const auto recognizer = engine.createRecognizer(nullptr, completeSettings());
    const auto other = dummy();
    EXPECT_TRUE(engine.registerRecognizer(other.get()));
    engine.unregisterRecognizer(other.get());
}

TEST_F(TalvoxTest, MissingRecognizerSettingsAreABrokenInvariantAndMeanTheDefaults) {
    const AssertCapture asserts;
    const auto recognizer = engine.createRecognizer(nullptr, nullptr);
    EXPECT_EQ(1U, asserts.count());
    ASSERT_TRUE(recognizer);
    EXPECT_EQ("ru-RU", recognizer->getSettings()->getLanguage());
}

TEST_F(TalvoxTest, AVerboseRecognizerLogsTheCallersSettingsAsGiven) {
    const auto settings = completeSettings();
    settings->putInt(Settings::SKS_VERBOSE_LEVEL, 1);
    settings->putInt(Settings::SKS_SPEEX_QUALITY, 20);
    settings->putString(Settings::RS_SESSION_ID, "100% %s%n %% %");
    engine.setTalvoxSettings(settings->clone());
    const LogCapture log;
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(
        log.messages(),
        ElementsAre("TalvoxSettings::validate: bad speexQuality: 20, setting to default",
                    "createRecognizer called", settings->toXmlString("settings"),
                    "policyOverride default policy korvel_only, platformSupported 0 choosing "
                    "Korvel"));
    EXPECT_TRUE(log.containsPart("<sessionid>100% %s%n %% %</sessionid>"));
}

TEST_F(TalvoxTest, AVerbosityThatWasRepairedToZeroLogsNoSettings) {
    const auto settings = completeSettings();
    settings->putInt(Settings::SKS_VERBOSE_LEVEL, 11);
    const LogCapture log;
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(log.messages(), Not(Contains("createRecognizer called")));
}

/** The lines about keys without effect, each without its text behind the key. */
std::vector<std::string> keysWithoutEffect(const LogCapture& log) {
    const std::string begin = "createRecognizer: ";
    const std::string end = " has no effect on a recognizer, set it on the engine";
    std::vector<std::string> keys;
    for (const std::string& line : log.messages()) {
        if (line.rfind(begin, 0) == 0) {
            std::string expected = begin;
            expected.append(line, begin.size(), line.find(' ', begin.size()) - begin.size());
            expected += end;
            EXPECT_EQ(expected, line);
            keys.push_back(line.substr(begin.size(), line.size() - begin.size() - end.size()));
        }
    }
    return keys;
}

/** No value is a default or that of another call with another `variant`. */
boost::shared_ptr<Settings> changeEveryKey(int variant) {
    auto settings = boost::make_shared<Settings>();
    for (const Util::Bundle::ElemSpec* row = Settings::bundleSpecs; row->name != nullptr; ++row) {
        switch (row->type) {
            case Util::Bundle::BOOLEAN:
                settings->putBoolean(row->name, variant == 1);
                break;
            case Util::Bundle::INT:
                settings->putInt(row->name, variant);
                break;
            case Util::Bundle::FLOAT:
                settings->putFloat(row->name, 0.125F * static_cast<float>(variant));
                break;
            case Util::Bundle::LATLON:
                settings->putLatLon(row->name, {1.0F, static_cast<float>(variant)});
                break;
            default:
                settings->putString(row->name, std::string(32, static_cast<char>('a' + variant)));
        }
    }
    settings->putInt(Settings::SKS_VERBOSE_LEVEL, 0);
    settings->putString(Settings::SKS_ASR_POLICY_OVERRIDE, Settings::ASRO_DEFAULT);
    settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_KORVEL_ONLY);
    return settings;
}

TEST_F(TalvoxTest, EveryKeyHasALevel) {
    const Settings::KeyLevel* level = Settings::keyLevels;
    for (const Util::Bundle::ElemSpec* row = Settings::bundleSpecs; row->name != nullptr; ++row) {
        ASSERT_NE(nullptr, level->key);
        EXPECT_STREQ(row->name, level->key);
        ++level;
    }
    EXPECT_EQ(nullptr, level->key);
}

TEST_F(TalvoxTest, KeysWithoutEffectOnARecognizerAreLogged) {
    engine.setTalvoxSettings(changeEveryKey(2));
    const LogCapture log;
    engine.createRecognizer(nullptr, changeEveryKey(1));
    EXPECT_THAT(keysWithoutEffect(log),
                ElementsAre("url", "uuid", "eventslogging", "soundformat", "streaming",
                            "samplerate", "vad", "sessionmode", "upperconfidence",
                            "winnerleadconfidence", "lowerconfidence", "speexquality"));
}

TEST_F(TalvoxTest, KeysWithTheEnginesValueAreNotLogged) {
    engine.setTalvoxSettings(changeEveryKey(1));
    const LogCapture log;
    engine.createRecognizer(nullptr, changeEveryKey(1));
    EXPECT_THAT(keysWithoutEffect(log), IsEmpty());
}

TEST_F(TalvoxTest, DefaultThatDiffersFromTheEnginesValueIsLogged) {
    const auto settings = completeSettings();
    settings->putBoolean(Settings::SKS_STREAMING, true);
    engine.setTalvoxSettings(settings->clone());
    settings->putBoolean(Settings::SKS_STREAMING, false);
    const LogCapture log;
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(keysWithoutEffect(log), ElementsAre("streaming"));
}

TEST_F(TalvoxTest, KeysAreComparedBeforeTheirRepair) {
    const auto settings = completeSettings();
    settings->putInt(Settings::SKS_SAMPLE_RATE, 1000);
    engine.setTalvoxSettings(settings->clone());
    const LogCapture log;
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(keysWithoutEffect(log), IsEmpty());
    engine.setTalvoxSettings(completeSettings());
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(keysWithoutEffect(log), ElementsAre("samplerate"));
}

TEST_F(TalvoxTest, NothingHasAnEffectOnTheStandIn) {
    const auto settings = changeEveryKey(1);
    settings->putString(Settings::RS_ASR_POLICY, Settings::ASRP_DISABLED);
    const LogCapture log;
    engine.createRecognizer(nullptr, settings);
    EXPECT_THAT(keysWithoutEffect(log), IsEmpty());
}

TEST_F(TalvoxTest, LanguagesAreThoseOfTheCloudInByteOrder) {
    EXPECT_THAT(engine.getAvailableLanguages(), ElementsAre("ru-RU", "tr-TR", "uk-UA"));
    EXPECT_EQ(&engine.getAvailableLanguages(), &engine.getAvailableLanguages());
}

TEST_F(TalvoxTest, LanguagesOfTwoMechanismsAreJoinedWithoutDuplicates) {
    EXPECT_THAT(Engine::mergeLanguages({"ru-RU", "tr-TR"}, {"tr-TR", "en-US"}),
                ElementsAre("en-US", "ru-RU", "tr-TR"));
    EXPECT_THAT(Engine::mergeLanguages({"b", "a", "b", "B"}, {"\xC3\xA9", "a"}),
                ElementsAre("B", "a", "b", "\xC3\xA9"));
    EXPECT_THAT(Engine::mergeLanguages({}, {}), IsEmpty());
}

TEST_F(TalvoxTest, TheLeveledLogFollowsTheEnginesVerbosity) {
    const LogCapture log;
    tvLogFormatMessage(1, "hidden %d", 1);
    tvLogFormatMessage(0, "always %d", 0);
    setVerbosity(2);
    tvLogFormatMessage(2, "level %s", "two");
    tvLogFormatMessage(3, "hidden %d", 3);
    EXPECT_THAT(log.messages(), ElementsAre("always 0", "level two"));
}

TEST_F(TalvoxTest, TheLeveledLogNeedsNoLock) {
    setVerbosity(2);
    const LogCapture log;
    const Util::EventLock heldByThisThread;
    std::thread worker([] { tvLogFormatMessage(2, "from a worker"); });
    worker.join();
    EXPECT_THAT(log.messages(), ElementsAre("from a worker"));
}
