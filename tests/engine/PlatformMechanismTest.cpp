#include "talvox/PlatformMechanism.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <cstdlib>

#include "support/LogCapture.h"
#include "talvox/DummyRecognizer.h"
#include "talvox/Talvox.h"
#include "talvox/impl/KorvelRecognizer.h"

using Talvox::DummyRecognizer;
using Talvox::KorvelRecognizer;
using Talvox::Recognizer;
using Talvox::Settings;
using Engine = Talvox::Talvox;

namespace {

class FakeRecognizer : public Recognizer {
  public:
    FakeRecognizer(const Engine* facade, const boost::shared_ptr<const Settings>& settings)
        : Recognizer(facade, settings) {}
    void start() override {}
    void stop() override {}
    void cancel() override {}
};

class FakeMechanism : public Talvox::PlatformMechanism {
  public:
    FakeMechanism() { install(this); }
    ~FakeMechanism() override { install(nullptr); }
    FakeMechanism(const FakeMechanism&) = delete;
    FakeMechanism& operator=(const FakeMechanism&) = delete;

    bool isRecognitionAvailable() override {
        ++questions;
        return available;
    }
    std::vector<std::string> getAvailableLanguages() override { return languages; }
    boost::shared_ptr<Recognizer> createRecognizer(
        const Engine* facade, const boost::shared_ptr<const Settings>& settings) override {
        return works ? boost::make_shared<FakeRecognizer>(facade, settings)
                     : boost::shared_ptr<Recognizer>();
    }

    bool available = true;
    bool works = true;
    int questions = 0;
    std::vector<std::string> languages;
};

class PlatformMechanismTest : public ::testing::Test {
  protected:
    static boost::shared_ptr<Settings> settingsWith(const std::string& policy) {
        auto settings = boost::make_shared<Settings>();
        settings->putString(Settings::RS_ASR_POLICY, policy);
        return settings;
    }

    static boost::shared_ptr<Recognizer> create(const std::string& policy) {
        return Engine::getInstance().createRecognizer(
            boost::shared_ptr<Talvox::RecognizerListener>(), settingsWith(policy));
    }

    template <typename Type>
    static bool is(const boost::shared_ptr<Recognizer>& recognizer) {
        return boost::dynamic_pointer_cast<Type>(recognizer) != nullptr;
    }
};

TEST_F(PlatformMechanismTest, ServesWhatThePolicyGivesToThePlatform) {
    const TestSupport::LogCapture log;
    FakeMechanism mechanism;
    EXPECT_TRUE(is<FakeRecognizer>(create(Settings::ASRP_PLATFORM_ONLY)));
    EXPECT_TRUE(log.contains(
        "policyOverride default policy platform_only, platformSupported 1 choosing Platform"));
    EXPECT_TRUE(is<FakeRecognizer>(create(Settings::ASRP_PLATFORM_FIRST)));
    EXPECT_TRUE(is<KorvelRecognizer>(create(Settings::ASRP_KORVEL_ONLY)));
    EXPECT_TRUE(is<DummyRecognizer>(create(Settings::ASRP_DISABLED)));
}

TEST_F(PlatformMechanismTest, ItsRecognizerGoesByItsOwnSoundFormatAndQuality) {
    const FakeMechanism mechanism;
    const auto settings = settingsWith(Settings::ASRP_PLATFORM_ONLY);
    settings->putString(Settings::SKS_LOGGING_POLICY, Settings::LOG_WITH_SOUND_ALWAYS);
    settings->putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    settings->putInt(Settings::SKS_SPEEX_QUALITY, 3);
    settings->putInt(Settings::SKS_SAMPLE_RATE, 8000);
    const TestSupport::LogCapture log;
    Engine::getInstance().createRecognizer(nullptr, settings);
    EXPECT_TRUE(log.contains(
        "createRecognizer: samplerate has no effect on a recognizer, set it on the engine"));
    EXPECT_FALSE(log.containsPart("createRecognizer: soundformat"));
    EXPECT_FALSE(log.containsPart("createRecognizer: speexquality"));
    EXPECT_FALSE(log.containsPart("createRecognizer: logging"));
}

TEST_F(PlatformMechanismTest, IsAskedOncePerDecision) {
    FakeMechanism mechanism;
    create(Settings::ASRP_PLATFORM_FIRST);
    EXPECT_EQ(mechanism.questions, 1);
    mechanism.available = false;
    EXPECT_TRUE(is<KorvelRecognizer>(create(Settings::ASRP_PLATFORM_FIRST)));
    EXPECT_TRUE(is<DummyRecognizer>(create(Settings::ASRP_PLATFORM_ONLY)));
    EXPECT_EQ(mechanism.questions, 3);
}

TEST_F(PlatformMechanismTest, ThatCannotMakeARecognizerIsReplacedByTheStandIn) {
    FakeMechanism mechanism;
    mechanism.works = false;
    EXPECT_TRUE(is<DummyRecognizer>(create(Settings::ASRP_PLATFORM_ONLY)));
}

TEST_F(PlatformMechanismTest, IsForgottenWhenItIsTakenAway) {
    { const FakeMechanism mechanism; }
    EXPECT_EQ(Talvox::PlatformMechanism::getInstalled(), nullptr);
    EXPECT_TRUE(is<DummyRecognizer>(create(Settings::ASRP_PLATFORM_ONLY)));
}

/** Ends with 0 when all is well. The engine keeps its languages for the life of the process. */
[[noreturn]] void joinLanguages() {
    FakeMechanism mechanism;
    const Engine& engine = Engine::getInstance();
    const bool onlyOurs =
        engine.getAvailableLanguages() == KorvelRecognizer::getAvailableLanguages();
    const std::vector<std::string> joined{"de-DE", "ru-RU", "tr-TR", "uk-UA"};
    mechanism.languages = {"uk-UA", "de-DE"};
    const bool all = engine.getAvailableLanguages() == joined;
    mechanism.languages = {"fr-FR"};
    const bool kept = engine.getAvailableLanguages() == joined;
    std::_Exit(onlyOurs && all && kept ? 0 : 1);
}

TEST(PlatformLanguagesDeathTest, JoinOnceThePlatformKnowsThem) {
    testing::FLAGS_gtest_death_test_style = "threadsafe";
    EXPECT_EXIT(joinLanguages(), testing::ExitedWithCode(0), "");
}

}  // namespace
