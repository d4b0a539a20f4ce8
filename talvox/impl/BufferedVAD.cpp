#include "talvox/impl/BufferedVAD.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <vector>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/impl/VadNames.h"
#include "talvox/impl/VadNumber.h"

namespace {

constexpr int LOG_DECISIONS = 1;
constexpr int LOG_HISTORY = 2;

unsigned divideOrZero(unsigned dividend, unsigned divisor) {
    return divisor != 0 ? dividend / divisor : 0;
}

float shareOf(std::size_t part, std::size_t whole) {
    return whole != 0 ? static_cast<float>(part) / static_cast<float>(whole)
                      : std::numeric_limits<float>::quiet_NaN();
}

unsigned toFrames(unsigned ms, unsigned msPerFrame) {
    const unsigned frames = divideOrZero(ms, msPerFrame);
    if (frames > Talvox::BufferedVAD::HISTORY_FRAMES_MAX) {
        kdLogFormatMessage("BufferedVAD: history of %u frames cut to %u", frames,
                           Talvox::BufferedVAD::HISTORY_FRAMES_MAX);
    }
    return std::min(frames, Talvox::BufferedVAD::HISTORY_FRAMES_MAX);
}

unsigned durationMs(const Sound::SoundDataBuffer& buffer) {
    const int rate = buffer.getInfo().getSampleRate();
    return rate != 0 ? static_cast<unsigned>(int64_t{buffer.getSampleCount()} * 1000 / rate) : 0;
}

}  // namespace

namespace Talvox {

BufferedVAD::BufferedVAD(const boost::shared_ptr<FrameVAD>& frameDetector)
    : frameVad(frameDetector) {}

void BufferedVAD::setSoundDataInfo(const Sound::SoundDataInfo& format) {
    info = format;
    frameVad->setSoundDataInfo(format);
}

void BufferedVAD::setSessionMode(Sound::Recorder::Mode mode) {
    frameVad->setSessionMode(mode);
}

int BufferedVAD::getLeadingNoiseMS() const {
    return frameVad->getLeadingNoiseMS();
}

void BufferedVAD::start() {
    const unsigned bytesPerSecond = static_cast<unsigned>(info.getChannelCount()) *
                                    static_cast<unsigned>(info.getSampleRate()) *
                                    static_cast<unsigned>(info.getSampleSize());
    const unsigned msPerFrame =
        divideOrZero(frameVad->getFrameStepInBytes() * 1000U, bytesPerSecond);
    nFramesOn = toFrames(analyzeMsOn, msPerFrame);
    nFramesOff = toFrames(analyzeMsOff, msPerFrame);
    frames.resize(std::max(nFramesOn, nFramesOff));
    frameVad->start();
}

void BufferedVAD::processNoise(const Sound::SoundDataBuffer& buffer) {
    frameVad->processNoise(buffer);
}

void BufferedVAD::process(const Sound::SoundDataBuffer& buffer) {
    decideFrames(buffer);
    if (verboseLevel >= LOG_HISTORY) {
        dumpFrames();
    }
    wasSpeech = speech;
    if (speech) {
        lookForSilence(buffer);
    } else {
        lookForSpeech();
    }
}

void BufferedVAD::decideFrames(const Sound::SoundDataBuffer& buffer) {
    const std::vector<unsigned char>& bytes = buffer.getData();
    const std::size_t size = frameVad->getFrameSizeInBytes();
    const std::size_t step = frameVad->getFrameStepInBytes();
    if (size == 0 || step == 0 || bytes.size() < size) {
        return;
    }
    const std::size_t lastOffset = bytes.size() - size;
    std::size_t count = lastOffset / step + 1;
    std::size_t offset = 0;
    if (count > frames.size()) {
        count = frames.size();
        offset = lastOffset - count * step;
    }
    for (std::size_t i = 0; i < count; ++i) {
        frames.push(frameVad->processFrame(bytes.data() + offset));
        offset += step;
    }
}

void BufferedVAD::lookForSpeech() {
    const float activity = getActivity(false);
    if (verboseLevel >= LOG_DECISIONS) {
        kdLogFormatMessage("speech off; nFramesOn %d; activity: %f; activityOn %f",
                           static_cast<int>(nFramesOn), static_cast<double>(activity),
                           static_cast<double>(activityOn));
    }
    if (activity > activityOn) {
        speech = true;
        msSinceSpeechStart = 0;
    }
}

void BufferedVAD::lookForSilence(const Sound::SoundDataBuffer& buffer) {
    msSinceSpeechStart += durationMs(buffer);
    if (msSinceSpeechStart <= minVoiceTimeMs) {
        if (verboseLevel >= LOG_DECISIONS) {
            kdLogFormatMessage("speechOn; msSinceSpeechStart %d minVoiceTimeMs %d",
                               static_cast<int>(msSinceSpeechStart),
                               static_cast<int>(minVoiceTimeMs));
        }
        return;
    }
    const float activity = getActivity(true);
    if (verboseLevel >= LOG_DECISIONS) {
        kdLogFormatMessage("speech on; nFramesOff %d; activity: %f; activityOff %f",
                           static_cast<int>(nFramesOff), static_cast<double>(activity),
                           static_cast<double>(activityOff));
    }
    if (activity < activityOff) {
        speech = false;
    }
}

bool BufferedVAD::isSpeech() const {
    return speech;
}

float BufferedVAD::getLatestActivity() const {
    return getActivity(wasSpeech);
}

int BufferedVAD::getNoiseRow() const {
    return frameVad->getNoiseRow();
}

void BufferedVAD::cancel() {
    frameVad->cancel();
}

void BufferedVAD::setParameter(const std::string& name, const std::string& value) {
    if (name == VadNames::ENGINE) {
        KOR_ASSERT_AT(value == VadNames::BUFFERED, "aValue == \"buffered\"",
                      "talvox/impl/BufferedVAD", 174);
    } else if (name == VadNames::SUBENGINE) {
        return;
    } else if (name == VadNames::ANALYZE_MS) {
        analyzeMsOff = static_cast<unsigned>(parseIntParameter(value));
        kdLogFormatMessage("analyzeMS %d", static_cast<int>(analyzeMsOff));
    } else if (name == VadNames::ANALYZE_MS_OFF) {
        analyzeMsOff = static_cast<unsigned>(parseIntParameter(value));
        kdLogFormatMessage("analyzeMSoff %d", static_cast<int>(analyzeMsOff));
    } else if (name == VadNames::ANALYZE_MS_ON) {
        analyzeMsOn = static_cast<unsigned>(parseIntParameter(value));
        kdLogFormatMessage("analyzeMsOn");
    } else if (name == VadNames::ACTIVITY_ON) {
        activityOn = parseFloatParameter(value);
        kdLogFormatMessage("activityOn %f", static_cast<double>(activityOn));
    } else if (name == VadNames::ACTIVITY_OFF) {
        activityOff = parseFloatParameter(value);
        kdLogFormatMessage("activityOff %f", static_cast<double>(activityOff));
    } else if (name == VadNames::MIN_VOICE_TIME_MS) {
        minVoiceTimeMs = static_cast<unsigned>(parseIntParameter(value));
        kdLogFormatMessage("minVoiceTimeMS %d", static_cast<int>(minVoiceTimeMs));
    } else if (name == VadNames::VERBOSE_LOG) {
        verboseLevel = parseIntParameter(value);
        kdLogFormatMessage("verboseLevel %d", verboseLevel);
    } else {
        frameVad->setParameter(name, value);
    }
}

void BufferedVAD::dumpFrames() const {
    const float share = shareOf(frames.countNewest(frames.size()), frames.size());
    kdLogFormatMessage("%f: %s\n", static_cast<double>(share),
                       frames.toString(DUMPED_FRAMES_MAX).c_str());
}

float BufferedVAD::getActivity(bool whileSpeechIsOn) const {
    const std::size_t span = whileSpeechIsOn ? nFramesOff : nFramesOn;
    return shareOf(frames.countNewest(span), span);
}

}  // namespace Talvox
