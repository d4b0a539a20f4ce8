#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/Talvox.h"

using Talvox::Settings;
using ::testing::ElementsAre;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using Engine = Talvox::Talvox;

namespace {

Settings withPolicies(const std::string& asr, const std::string& policy) {
    Settings settings;
    settings.putString(Settings::SKS_ASR_POLICY_OVERRIDE, asr);
    settings.putString(Settings::RS_ASR_POLICY, policy);
    return settings;
}

char letterOf(Engine::RecognitionMechanism mechanism) {
    return "KPD"[mechanism];
}

/**
 * The decisions for an override, as letters (K cloud, P platform, D none), for the application's
 * policies korvel_only, platform_only, platform_first, disabled and one that nobody knows.
 */
std::string decisions(const std::string& asr, bool platformSupported) {
    std::string letters;
    for (const std::string& policy :
         {Settings::ASRP_KORVEL_ONLY, Settings::ASRP_PLATFORM_ONLY, Settings::ASRP_PLATFORM_FIRST,
          Settings::ASRP_DISABLED, std::string("unknown")}) {
        letters += letterOf(Engine::decideMechanism(withPolicies(asr, policy), platformSupported));
    }
    return letters;
}

}  // namespace

TEST(Mechanism, NumbersAreFixed) {
    EXPECT_EQ(0, Engine::MechanismKorvel);
    EXPECT_EQ(1, Engine::MechanismPlatform);
    EXPECT_EQ(2, Engine::MechanismDummy);
}

TEST(Mechanism, ByDefaultTheApplicationDecides) {
    EXPECT_EQ("KDKDD", decisions("default", false));
    EXPECT_EQ("KPPDD", decisions("default", true));
}

TEST(Mechanism, KorvelOnlyEverywhereIsAlwaysTheCloud) {
    EXPECT_EQ("KKKKK", decisions("korvel_only_everywhere", false));
    EXPECT_EQ("KKKKK", decisions("korvel_only_everywhere", true));
}

TEST(Mechanism, KorvelOnlyIfEnabledIsTheCloudUnlessTheApplicationDisabledIt) {
    EXPECT_EQ("KKKDK", decisions("korvel_only_if_enabled", false));
    EXPECT_EQ("KKKDK", decisions("korvel_only_if_enabled", true));
}

TEST(Mechanism, PlatformFirstEverywhereFallsBackToTheCloud) {
    EXPECT_EQ("KKKKK", decisions("platform_first_everywhere", false));
    EXPECT_EQ("PPPPP", decisions("platform_first_everywhere", true));
}

TEST(Mechanism, PlatformFirstIfEnabledFallsBackUnlessTheApplicationDisabledIt) {
    EXPECT_EQ("KKKDK", decisions("platform_first_if_enabled", false));
    EXPECT_EQ("PPPDP", decisions("platform_first_if_enabled", true));
}

TEST(Mechanism, PlatformOnlyEverywhereNeedsThePlatform) {
    EXPECT_EQ("DDDDD", decisions("platform_only_everywhere", false));
    EXPECT_EQ("PPPPP", decisions("platform_only_everywhere", true));
}

TEST(Mechanism, PlatformOnlyIfEnabledNeedsThePlatformAndTheApplication) {
    EXPECT_EQ("DDDDD", decisions("platform_only_if_enabled", false));
    EXPECT_EQ("PPPDP", decisions("platform_only_if_enabled", true));
}

TEST(Mechanism, DisabledAndUnknownOverridesMeanNone) {
    for (const char* asr : {"disabled", "unknown", "", "DEFAULT"}) {
        EXPECT_EQ("DDDDD", decisions(asr, false)) << asr;
        EXPECT_EQ("DDDDD", decisions(asr, true)) << asr;
    }
}

TEST(Mechanism, EachDecisionIsLogged) {
    const LogCapture log;
    const Engine& engine = Engine::getInstance();
    EXPECT_EQ(Engine::MechanismKorvel,
              engine.getRecognitionMechanism(withPolicies("default", "korvel_only")));
    EXPECT_EQ(Engine::MechanismDummy,
              engine.getRecognitionMechanism(withPolicies("default", "disabled")));
    EXPECT_THAT(
        log.messages(),
        ElementsAre(
            "policyOverride default policy korvel_only, platformSupported 0 choosing Korvel",
            "policyOverride default policy disabled, platformSupported 0 choosing Dummy"));
}

TEST(Mechanism, RecognitionIsAvailableWithEverythingButTheStandIn) {
    EXPECT_TRUE(Engine::isAvailable(Engine::MechanismKorvel));
    EXPECT_TRUE(Engine::isAvailable(Engine::MechanismPlatform));
    EXPECT_FALSE(Engine::isAvailable(Engine::MechanismDummy));
    const Engine& engine = Engine::getInstance();
    EXPECT_TRUE(engine.isRecognitionAvailable(withPolicies("default", "korvel_only")));
    EXPECT_TRUE(engine.isRecognitionAvailable(withPolicies("default", "platform_first")));
    EXPECT_FALSE(engine.isRecognitionAvailable(withPolicies("default", "platform_only")));
    EXPECT_FALSE(engine.isRecognitionAvailable(withPolicies("disabled", "korvel_only")));
}

TEST(Mechanism, AnyOtherMechanismIsABrokenInvariant) {
    const AssertCapture asserts;
    EXPECT_FALSE(Engine::isAvailable(static_cast<Engine::RecognitionMechanism>(3)));
    ASSERT_EQ(1U, asserts.count());
    EXPECT_EQ("false", asserts.reports()[0].condition);
    EXPECT_EQ("talvox/Talvox", asserts.reports()[0].path);
}
