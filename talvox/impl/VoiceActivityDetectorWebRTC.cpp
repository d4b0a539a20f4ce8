#include "talvox/impl/VoiceActivityDetectorWebRTC.h"

#include <array>
#include <cstdint>
#include <cstring>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/impl/VadNames.h"
#include "talvox/impl/VadNumber.h"

namespace {

constexpr char PATH[] = "talvox/impl/VoiceActivityDetectorWebRTC";

/** Samples of the longest frame that the library takes: 30 ms at 32 kHz. */
constexpr std::size_t LONGEST_FRAME = 960;

/** Stores the value of a parameter and logs what was stored. */
template <typename Field>
void store(Field& field, const char* logName, const std::string& value) {
    field = static_cast<Field>(Talvox::parseIntParameter(value));
    kdLogFormatMessage("%s %d", logName, static_cast<int>(field));
}

}  // namespace

bool operator==(const WebRtc_ModeParams& left, const WebRtc_ModeParams& right) {
    return left.individual == right.individual && left.total == right.total &&
           left.overhangmax1 == right.overhangmax1 && left.overhangmax2 == right.overhangmax2;
}

namespace Talvox {

VoiceActivityDetectorWebRTC::~VoiceActivityDetectorWebRTC() {
    VoiceActivityDetectorWebRTC::cancel();
}

void VoiceActivityDetectorWebRTC::setSoundDataInfo(const Sound::SoundDataInfo& format) {
    info = format;
}

void VoiceActivityDetectorWebRTC::setSessionMode(Sound::Recorder::Mode mode) {
    sessionMode = mode;
}

int VoiceActivityDetectorWebRTC::getLeadingNoiseMS() const {
    return leadingNoiseMs;
}

void VoiceActivityDetectorWebRTC::start() {
    if (!KOR_ASSERT_AT(!isStarted, "!isStarted", PATH, 78)) {
        WebRtcVad_Free(handle);
    }
    isStarted = true;
    WebRtcVad_Create(&handle);
    WebRtcVad_Init(handle);
    WebRtcVad_set_mode(handle, static_cast<int16_t>(aggressiveness));
    if (hasModeParams()) {
        WebRtcVad_set_mode_fine_grained(handle, &modeParams);
    }
    if (sessionMode != Sound::Recorder::MODE_VOICE_RECOGNITION) {
        WebRtcVad_force_noise(handle, 1);
    }
}

void VoiceActivityDetectorWebRTC::processNoise(const Sound::SoundDataBuffer& buffer) {
    powerEstimator.learnNoise(buffer);
    if (hasModeParams()) {
        return;
    }
    for (const NoiseRow& row : NOISE_ROWS) {
        if (row.noiseLevelDb <= powerEstimator.getNoiseLevel()) {
            noiseRow = static_cast<int>(&row - NOISE_ROWS);
            WebRtcVad_set_mode_fine_grained(handle, &row.params);
            return;
        }
    }
}

void VoiceActivityDetectorWebRTC::cancel() {
    if (isStarted) {
        stop();
    }
}

void VoiceActivityDetectorWebRTC::setParameter(const std::string& name, const std::string& value) {
    if (name == VadNames::ENGINE) {
        return;
    }
    if (name == VadNames::AGGRESSIVENESS) {
        store(aggressiveness, "aggressiveness", value);
    } else if (name == VadNames::FRAME_MS) {
        store(frameMs, "frameMS", value);
    } else if (name == VadNames::VERBOSE_LOG) {
        store(verboseLevel, "verboseLevel", value);
    } else if (name == VadNames::INDIVIDUAL) {
        store(modeParams.individual, "individual", value);
    } else if (name == VadNames::TOTAL) {
        store(modeParams.total, "total", value);
    } else if (name == VadNames::OVERHANG_MAX_1) {
        store(modeParams.overhangmax1, "over_hang_max_1", value);
    } else if (name == VadNames::OVERHANG_MAX_2) {
        store(modeParams.overhangmax2, "over_hang_max_2", value);
    } else {
        kdLogFormatMessage("Unknown WebRTC VAD parameter setting: %s", name.c_str());
    }
}

unsigned VoiceActivityDetectorWebRTC::getFrameSizeInBytes() const {
    const unsigned bytesPerSecond =
        static_cast<unsigned>(info.getSampleSize()) * static_cast<unsigned>(info.getSampleRate());
    return static_cast<unsigned>(info.getChannelCount()) *
           (static_cast<unsigned>(frameMs) * bytesPerSecond) / 1000U;
}

bool VoiceActivityDetectorWebRTC::processFrame(const unsigned char* frame) {
    KOR_ASSERT_AT(isStarted, "isStarted", PATH, 146);
    KOR_ASSERT_AT(info.getChannelCount() == 1, "info.getChannelCount() == 1", PATH, 147);
    KOR_ASSERT_AT(info.getSampleSize() == 2, "info.getSampleSize() == 2", PATH, 148);
    WebRtcVad_force_noise(handle, 0);
    const unsigned samples =
        static_cast<unsigned>(frameMs) * static_cast<unsigned>(info.getSampleRate()) / 1000U;
    const auto length = static_cast<uint16_t>(samples);
    // The library refuses frames longer than its longest without a look at them; numbers that have
    // wrapped around may also ask for more than the frame has. Refused frames count as speech.
    std::array<int16_t, LONGEST_FRAME> aligned;
    const std::size_t bytes = length * sizeof(int16_t);
    if (length > aligned.size() || bytes > getFrameSizeInBytes()) {
        return true;
    }
    std::memcpy(aligned.data(), frame, bytes);
    return WebRtcVad_Process(handle, static_cast<int16_t>(info.getSampleRate()), aligned.data(),
                             static_cast<int16_t>(length)) != 0;
}

void VoiceActivityDetectorWebRTC::stop() {
    KOR_ASSERT_AT(isStarted, "isStarted", PATH, 169);
    WebRtcVad_Free(handle);
    isStarted = false;
    handle = nullptr;
}

bool VoiceActivityDetectorWebRTC::hasModeParams() const {
    return !(modeParams == WebRtc_ModeParams{});
}

}  // namespace Talvox
