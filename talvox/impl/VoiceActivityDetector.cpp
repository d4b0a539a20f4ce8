#include "talvox/impl/VoiceActivityDetector.h"

#include <boost/make_shared.hpp>
#include <limits>

#include "pal/kd_log.h"
#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/FrameVAD.h"
#include "talvox/impl/VadNames.h"
#include "talvox/impl/VadParameterText.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"

namespace Talvox {

VoiceActivityDetector::~VoiceActivityDetector() = default;

void VoiceActivityDetector::setSessionMode(Sound::Recorder::Mode /*mode*/) {}

int VoiceActivityDetector::getLeadingNoiseMS() const {
    return 0;
}

float VoiceActivityDetector::getLatestActivity() const {
    return std::numeric_limits<float>::quiet_NaN();
}

int VoiceActivityDetector::getNoiseRow() const {
    return -1;
}

void VoiceActivityDetector::processNoise(const Sound::SoundDataBuffer& /*buffer*/) {}

boost::shared_ptr<VoiceActivityDetector> VoiceActivityDetector::create(
    const std::string& parameters) {
    return create(parameters, [](const boost::shared_ptr<FrameVAD>& frameVad) { return frameVad; });
}

boost::shared_ptr<VoiceActivityDetector> VoiceActivityDetector::create(
    const std::string& parameters, const FrameDecorator& decorate) {
    const VadParameterText parsed(parameters);
    for (const std::string& setting : parsed.badSettings) {
        kdLogFormatMessage("Bad VAD parameter setting: %s", setting.c_str());
    }
    const std::string engine = parsed.valueOf(VadNames::ENGINE, VadNames::BUFFERED);
    boost::shared_ptr<VoiceActivityDetector> detector;
    if (engine == VadNames::WEBRTC) {
        detector = decorate(boost::make_shared<VoiceActivityDetectorWebRTC>());
    } else {
        std::string subengine = parsed.valueOf(VadNames::SUBENGINE);
        if (engine != VadNames::BUFFERED) {
            kdLogFormatMessage("Unknown engine name for VoiceActivityDetector: %s", engine.c_str());
            subengine.clear();
        }
        detector = boost::make_shared<BufferedVAD>(decorate(FrameVAD::create(subengine)));
    }
    for (const auto& [name, value] : parsed.values) {
        detector->setParameter(name, value);
    }
    return detector;
}

}  // namespace Talvox
