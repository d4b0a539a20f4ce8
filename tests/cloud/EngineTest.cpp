#include "EngineTest.h"

#include <boost/make_shared.hpp>
#include <utility>

#include "core/network/NetworkManager.h"
#include "pal/kd.h"

namespace CloudTest {

namespace {

const int64_t NS_PER_MS = 1000000;
const int64_t CLOCK_START = 1000000 * NS_PER_MS;

}  // namespace

PlainRecognizer::PlainRecognizer(const Talvox::Talvox* facade,
                                 boost::shared_ptr<const Talvox::Settings> recognizerSettings)
    : Recognizer(facade, std::move(recognizerSettings)) {}

EngineTest::EngineTest() {
    kdUseManualClockKOR(CLOCK_START);
    Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::WIFI);
    Sound::Recorder::setFactory([this]() -> boost::shared_ptr<Sound::Recorder> {
        recorder = boost::make_shared<ScriptedRecorder>();
        if (prepareRecorder) {
            prepareRecorder(*recorder);
        }
        return recorder;
    });
    engine().setTalvoxSettings(boost::make_shared<Talvox::Settings>());
    configureText(Talvox::Settings::SKS_UUID, UUID);
}

EngineTest::~EngineTest() {
    Sound::Recorder::setFactory({});
    Network::NetworkManager::getInstance().overrideReachability(-1);
    engine().setTalvoxSettings(boost::make_shared<Talvox::Settings>());
    kdDrainEventsKOR();
    kdUseRealClockKOR();
}

Talvox::Talvox& EngineTest::engine() {
    return Talvox::Talvox::getInstance();
}

void EngineTest::configure(const std::function<void(Talvox::Settings&)>& change) {
    const boost::shared_ptr<Talvox::Settings> settings = engine().getTalvoxSettings()->clone();
    change(*settings);
    engine().setTalvoxSettings(settings);
}

void EngineTest::configureText(const std::string& key, const std::string& value) {
    configure([&](Talvox::Settings& settings) { settings.putString(key, value); });
}

void EngineTest::advanceMs(int64_t milliseconds) {
    kdAdvanceClockKOR(milliseconds * NS_PER_MS);
}

}  // namespace CloudTest
