#include "talvox/Talvox.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <exception>
#include <new>

#include "core/network/NetworkTaskHolder.h"
#include "core/util/EventLock.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/DummyRecognizer.h"
#include "talvox/PlatformMechanism.h"
#include "talvox/impl/EarlyInit.h"
#include "talvox/impl/KorvelRecognizer.h"
#include "talvox/impl/ReserveRecognizer.h"

namespace Talvox {

namespace {

const char* const ASSERT_PATH = "talvox/Talvox";
const char* const XML_ROOT = "settings";

/** For what is not a mechanism. */
void assertUnknownMechanism() {
    KOR_ASSERT_AT(false, "false", ASSERT_PATH, __LINE__);
}

/** Makes a text stand for itself as a format. */
std::string toFormat(const std::string& text) {
    std::string format;
    for (const char c : text) {
        format.append(c == '%' ? 2 : 1, c);
    }
    return format;
}

void logSettings(const Settings& settings) {
    kdLogFormatMessage("createRecognizer called");
    const std::string format = toFormat(settings.toXmlString(XML_ROOT));
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-security"
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
    kdLogFormatMessage(format.c_str());
#pragma GCC diagnostic pop
}

bool isSame(const Settings& left, const Settings& right, const char* key) {
    if (!left.hasKey(key) || !right.hasKey(key)) {
        return left.hasKey(key) == right.hasKey(key);
    }
    const Util::Bundle::Elem& one = left.get(key);
    const Util::Bundle::Elem& other = right.get(key);
    return one.type == other.type && one.scalar == other.scalar && one.text == other.text;
}

bool hasEffect(Settings::Level level, Talvox::RecognitionMechanism mechanism) {
    switch (level) {
        case Settings::Level::ENGINE:
            return false;
        case Settings::Level::ENGINE_FOR_CLOUD:
            return mechanism == Talvox::MechanismPlatform;
        case Settings::Level::RECOGNIZER:
        case Settings::Level::BOTH:
            break;
    }
    return true;
}

void logWhatHasNoEffect(const Settings& given, const Settings& engineSettings,
                        Talvox::RecognitionMechanism mechanism) {
    for (const Settings::KeyLevel* row = Settings::keyLevels; row->key != nullptr; ++row) {
        if (!hasEffect(row->level, mechanism) && !isSame(given, engineSettings, row->key)) {
            kdLogFormatMessage(
                "createRecognizer: %s has no effect on a recognizer, set it on the engine",
                row->key);
        }
    }
}

}  // namespace

TALVOX_EARLY const std::string Talvox::VERSION(TALVOX_VERSION);

Talvox& Talvox::getInstance() {
    return instance();
}

Talvox::Talvox()
    : talvoxSettings(boost::make_shared<Settings>()),
      reserve(boost::make_shared<ReserveRecognizer>(this, talvoxSettings)),
      registrationLock(kdThreadMutexCreate(nullptr)),
      activeRecognizer(nullptr) {
    if (registrationLock == nullptr) {
        throw std::bad_alloc();
    }
}

Talvox::~Talvox() {
    kdThreadMutexFree(registrationLock);
}

boost::shared_ptr<const Settings> Talvox::getTalvoxSettings() const {
    boost::shared_ptr<const Settings> current = boost::atomic_load(&talvoxSettings);
    return KOR_ASSERT_AT(current, "talvoxSettings", ASSERT_PATH, __LINE__)
               ? current
               : boost::make_shared<const Settings>();
}

void Talvox::setTalvoxSettings(const boost::shared_ptr<Settings>& settings) {
    if (!KOR_ASSERT_AT(settings, "settings", ASSERT_PATH, __LINE__)) {
        return;
    }
    const Util::EventLock lock;
    boost::atomic_store(&talvoxSettings, boost::shared_ptr<const Settings>(settings));
}

bool Talvox::registerRecognizer(Recognizer* recognizer) const {
    kdThreadMutexLock(registrationLock);
    const bool isFree = activeRecognizer.load() == nullptr;
    if (isFree) {
        activeRecognizer.store(recognizer);
    }
    kdThreadMutexUnlock(registrationLock);
    return isFree;
}

void Talvox::unregisterRecognizer(Recognizer* recognizer) const {
    Recognizer* expected = recognizer;
    activeRecognizer.compare_exchange_strong(expected, nullptr);
}

Talvox::RecognitionMechanism Talvox::decideMechanism(const Settings& settings,
                                                     bool platformSupported) {
    const std::string& asr = settings.getString(Settings::SKS_ASR_POLICY_OVERRIDE);
    const std::string& policy = settings.getString(Settings::RS_ASR_POLICY);
    const bool isEnabled = policy != Settings::ASRP_DISABLED;
    const bool isDefault = asr == Settings::ASRO_DEFAULT;
    const bool isFirstEverywhere = asr == Settings::ASRO_PLATFORM_FIRST_EVERYWHERE;
    const bool isFirstIfEnabled = asr == Settings::ASRO_PLATFORM_FIRST_IF_ENABLED;

    if ((isDefault && policy == Settings::ASRP_KORVEL_ONLY) ||
        asr == Settings::ASRO_KORVEL_ONLY_EVERYWHERE ||
        (asr == Settings::ASRO_KORVEL_ONLY_IF_ENABLED && isEnabled)) {
        return MechanismKorvel;
    }
    if (!platformSupported) {
        const bool fallsBack = (isDefault && policy == Settings::ASRP_PLATFORM_FIRST) ||
                               isFirstEverywhere || (isFirstIfEnabled && isEnabled);
        return fallsBack ? MechanismKorvel : MechanismDummy;
    }
    const bool usesPlatform =
        (isDefault &&
         (policy == Settings::ASRP_PLATFORM_ONLY || policy == Settings::ASRP_PLATFORM_FIRST)) ||
        asr == Settings::ASRO_PLATFORM_ONLY_EVERYWHERE || isFirstEverywhere ||
        ((asr == Settings::ASRO_PLATFORM_ONLY_IF_ENABLED || isFirstIfEnabled) && isEnabled);
    return usesPlatform ? MechanismPlatform : MechanismDummy;
}

Talvox::RecognitionMechanism Talvox::getRecognitionMechanism(const Settings& settings) const {
    const bool platformSupported = isPlatformSupported();
    const RecognitionMechanism mechanism = decideMechanism(settings, platformSupported);
    logMechanism(mechanism, settings, platformSupported);
    return mechanism;
}

void Talvox::logMechanism(RecognitionMechanism mechanism, const Settings& settings,
                          bool platformSupported) {
    static const char* const NAMES[] = {"Korvel", "Platform", "Dummy"};
    kdLogFormatMessage("policyOverride %s policy %s, platformSupported %d choosing %s",
                       settings.getString(Settings::SKS_ASR_POLICY_OVERRIDE).c_str(),
                       settings.getString(Settings::RS_ASR_POLICY).c_str(),
                       platformSupported ? 1 : 0, NAMES[mechanism]);
}

bool Talvox::isRecognitionAvailable(const Settings& settings) const {
    return isAvailable(getRecognitionMechanism(settings));
}

bool Talvox::isAvailable(RecognitionMechanism mechanism) {
    switch (mechanism) {
        case MechanismKorvel:
        case MechanismPlatform:
            return true;
        case MechanismDummy:
            return false;
    }
    assertUnknownMechanism();
    return false;
}

boost::shared_ptr<Recognizer> Talvox::createRecognizer(
    const boost::shared_ptr<RecognizerListener>& listener,
    const boost::shared_ptr<const Settings>& settings) const {
    try {
        return makeRecognizer(listener, settings);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("createRecognizer: no recognizer can be made: %s", exception.what());
    }
    return lendReserve(listener);
}

boost::shared_ptr<Recognizer> Talvox::makeRecognizer(
    const boost::shared_ptr<RecognizerListener>& listener,
    const boost::shared_ptr<const Settings>& settings) const {
    const bool isGiven = KOR_ASSERT_AT(settings, "settings", ASSERT_PATH, __LINE__);
    const boost::shared_ptr<Settings> copy =
        isGiven ? settings->clone() : boost::make_shared<Settings>();
    copy->validate();
    if (copy->getInt(Settings::SKS_VERBOSE_LEVEL) > 0) {
        logSettings(isGiven ? *settings : *copy);
    }
    const RecognitionMechanism mechanism = getRecognitionMechanism(*copy);
    if (isGiven && mechanism != MechanismDummy) {
        logWhatHasNoEffect(*settings, *getTalvoxSettings(), mechanism);
    }
    boost::shared_ptr<Recognizer> recognizer = makeRecognizer(mechanism, copy);
    recognizer->addListener(listener);
    return recognizer;
}

boost::shared_ptr<Recognizer> Talvox::makeRecognizer(
    RecognitionMechanism mechanism, const boost::shared_ptr<const Settings>& settings) const {
    if (mechanism == MechanismKorvel) {
        return boost::make_shared<KorvelRecognizer>(this, settings);
    }
    if (mechanism == MechanismPlatform) {
        const Util::EventLock lock;
        PlatformMechanism* const platform = PlatformMechanism::getInstalled();
        boost::shared_ptr<Recognizer> recognizer;
        if (platform != nullptr) {
            recognizer = platform->createRecognizer(this, settings);
        }
        return recognizer ? recognizer : boost::make_shared<DummyRecognizer>(this, settings);
    }
    if (mechanism != MechanismDummy) {
        assertUnknownMechanism();
    }
    return boost::make_shared<DummyRecognizer>(this, settings);
}

boost::shared_ptr<Recognizer> Talvox::lendReserve(
    const boost::shared_ptr<RecognizerListener>& listener) const noexcept {
    const Util::EventLock lock;
    if (reserve.use_count() > 1) {
        kdLogFormatMessage("createRecognizer: the stand-in is in use");
        return nullptr;
    }
    reserve->assign(listener);
    return reserve;
}

const std::vector<std::string>& Talvox::getAvailableLanguages() const {
    static std::vector<std::string> languages;
    static bool isPlatformAwaited = true;
    const Util::EventLock lock;
    // A platform may learn its languages later.
    PlatformMechanism* const platform = PlatformMechanism::getInstalled();
    if (languages.empty() || (platform != nullptr && isPlatformAwaited)) {
        const std::vector<std::string> others =
            platform != nullptr ? platform->getAvailableLanguages() : std::vector<std::string>();
        isPlatformAwaited = others.empty();
        languages = mergeLanguages(KorvelRecognizer::getAvailableLanguages(), others);
    }
    return languages;
}

std::vector<std::string> Talvox::mergeLanguages(const std::vector<std::string>& first,
                                                const std::vector<std::string>& second) {
    std::vector<std::string> languages(first);
    languages.insert(languages.end(), second.begin(), second.end());
    std::sort(languages.begin(), languages.end());
    languages.erase(std::unique(languages.begin(), languages.end()), languages.end());
    return languages;
}

bool Talvox::isPlatformSupported() {
    const Util::EventLock lock;
    PlatformMechanism* const platform = PlatformMechanism::getInstalled();
    return platform != nullptr && platform->isRecognitionAvailable();
}

}  // namespace Talvox
