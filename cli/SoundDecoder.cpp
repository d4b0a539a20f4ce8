#include "SoundDecoder.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <vector>

#include "Text.h"
#include "UsageError.h"
#include "pal/kd_log.h"

namespace Cli {

namespace {

const float FULL_SCALE = 32768.0f;
const int RATE_MIN_HZ = 1000;
const int RATE_MAX_HZ = 768000;
const std::size_t BLOCK_SAMPLES = 65536;

void checkRate(const std::string& name, const SF_INFO& info) {
    if (info.samplerate < RATE_MIN_HZ || info.samplerate > RATE_MAX_HZ) {
        refuseSound(
            name, "its sample rate of " + std::to_string(info.samplerate) + " Hz is out of range");
    }
}

float mixDown(const float* frame, int channels) {
    float sum = 0.0f;
    for (int channel = 0; channel < channels; ++channel) {
        sum += frame[channel];
    }
    const float sample = sum / static_cast<float>(channels) * FULL_SCALE;
    return std::isfinite(sample) ? sample : 0.0f;
}

std::string secondsText(double seconds) {
    return fixed(seconds, 0, 3) + " s";
}

/**
 * A message of libsndfile as a part of a sentence. Some end with a full stop, some begin with
 * "Error : ".
 */
std::string plainReason(const char* message) {
    std::string reason(message);
    const std::string prefix = "Error : ";
    if (reason.compare(0, prefix.size(), prefix) == 0) {
        reason.erase(0, prefix.size());
    }
    while (!reason.empty() && (reason.back() == '.' || reason.back() == '\n')) {
        reason.pop_back();
    }
    std::replace(reason.begin(), reason.end(), '\n', ' ');
    return reason;
}

}  // namespace

void refuseSound(const std::string& name, const std::string& reason) {
    throw UsageError("cannot read " + printable(name) + ": " + reason);
}

SoundFile openSound(const std::function<SNDFILE*()>& open, OpenFailure& failure) {
    static std::mutex mutex;
    const std::lock_guard<std::mutex> lock(mutex);
    SoundFile file(open(), &sf_close);
    if (!file) {
        failure = {sf_error(nullptr), plainReason(sf_strerror(nullptr))};
    }
    return file;
}

std::size_t samplesIn(int seconds, int sampleRateHz) {
    return static_cast<std::size_t>(sampleRateHz) * static_cast<std::size_t>(seconds);
}

AudioClip decodeSound(SNDFILE* file, const SF_INFO& info, const std::string& name,
                      std::size_t maxSamples) {
    checkRate(name, info);
    AudioClip clip;
    clip.sampleRateHz = info.samplerate;
    const auto channels = static_cast<std::size_t>(info.channels);
    const std::size_t blockFrames = std::max<std::size_t>(1, BLOCK_SAMPLES / channels);
    std::vector<float> block(blockFrames * channels);
    while (clip.samples.size() <= maxSamples) {
        const sf_count_t frames = std::max<sf_count_t>(
            0, sf_readf_float(file, block.data(), static_cast<sf_count_t>(blockFrames)));
        for (std::size_t frame = 0; frame < static_cast<std::size_t>(frames); ++frame) {
            clip.samples.push_back(mixDown(&block[frame * channels], info.channels));
        }
        if (const int error = sf_error(file)) {
            refuseSound(name, "only its first " + secondsText(clip.lengthS()) +
                                  " can be read: " + plainReason(sf_error_number(error)));
        }
        if (frames == 0) {
            break;
        }
    }
    if (clip.samples.empty()) {
        refuseSound(name, "it holds no sound");
    }
    return clip;
}

void warnOfCut(const std::string& name, double presentS, double promisedS) {
    kdLogFormatMessage("%s is cut: it holds %s of the %s that it promises", printable(name).c_str(),
                       secondsText(presentS).c_str(), secondsText(promisedS).c_str());
}

void warnOfCutWav(const std::string& name, const WavHead& head, std::uint64_t bytes,
                  const AudioClip& clip) {
    if (head.isOpenEnded || head.soundOffset + head.soundBytes <= bytes) {
        return;
    }
    const std::uint64_t present = bytes - head.soundOffset;
    warnOfCut(name, clip.lengthS(),
              clip.lengthS() * static_cast<double>(head.soundBytes) / static_cast<double>(present));
}

}  // namespace Cli
