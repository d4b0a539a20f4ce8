#include "talvox/impl/FrameVAD.h"

#include <boost/make_shared.hpp>
#include <cstddef>
#include <vector>

#include "pal/kd_log.h"
#include "talvox/impl/VadNames.h"
#include "talvox/impl/VoiceActivityDetectorWebRTC.h"

namespace Talvox {

void FrameVAD::setSessionMode(Sound::Recorder::Mode /*mode*/) {}

void FrameVAD::process(const Sound::SoundDataBuffer& buffer) {
    const std::vector<unsigned char>& bytes = buffer.getData();
    const std::size_t size = getFrameSizeInBytes();
    const std::size_t step = getFrameStepInBytes();
    if (size == 0 || step == 0 || size >= bytes.size()) {
        return;
    }
    const std::size_t end = bytes.size() - size;
    for (std::size_t offset = 0; offset < end;) {
        lastDecision = processFrame(bytes.data() + offset);
        if (step >= end - offset) {
            return;
        }
        offset += step;
    }
}

bool FrameVAD::isSpeech() const {
    return lastDecision;
}

unsigned FrameVAD::getFrameStepInBytes() const {
    return getFrameSizeInBytes();
}

boost::shared_ptr<FrameVAD> FrameVAD::create(const std::string& subengine) {
    if (!subengine.empty() && subengine != VadNames::WEBRTC) {
        kdLogFormatMessage("Unknown subengine type for FrameVAD: %s", subengine.c_str());
    }
    return boost::make_shared<VoiceActivityDetectorWebRTC>();
}

}  // namespace Talvox
