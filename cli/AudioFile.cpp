#include "AudioFile.h"

#include <sndfile.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>
#include <memory>

#include "UsageError.h"

namespace Cli {

namespace {

const float FULL_SCALE = 32768.0f;
const int RATE_MIN_HZ = 1000;
const int RATE_MAX_HZ = 768000;
const std::size_t BLOCK_SAMPLES = 65536;

using SoundFile = std::unique_ptr<SNDFILE, int (*)(SNDFILE*)>;

[[noreturn]] void refuse(const std::string& path, const std::string& reason) {
    throw UsageError("cannot read " + path + ": " + reason);
}

void checkIsFile(const std::string& path) {
    struct stat status = {};
    if (stat(path.c_str(), &status) != 0) {
        refuse(path, std::strerror(errno));
    }
    if (S_ISDIR(status.st_mode)) {
        refuse(path, "it is a directory");
    }
    if (S_ISREG(status.st_mode) && status.st_size == 0) {
        refuse(path, "the file is empty");
    }
}

/** libsndfile ends some of its messages with a full stop and some with none. */
std::string plainReason(const char* message) {
    std::string reason(message);
    while (!reason.empty() && (reason.back() == '.' || reason.back() == '\n')) {
        reason.pop_back();
    }
    std::replace(reason.begin(), reason.end(), '\n', ' ');
    return reason;
}

SoundFile openSoundFile(const std::string& path, SF_INFO& info) {
    SoundFile file(sf_open(path.c_str(), SFM_READ, &info), &sf_close);
    if (!file) {
        refuse(path, sf_error(nullptr) == SF_ERR_UNRECOGNISED_FORMAT
                         ? "it is not sound of a known format"
                         : plainReason(sf_strerror(nullptr)));
    }
    if (info.samplerate < RATE_MIN_HZ || info.samplerate > RATE_MAX_HZ) {
        refuse(path,
               "its sample rate of " + std::to_string(info.samplerate) + " Hz is out of range");
    }
    return file;
}

float mixDown(const float* frame, int channels) {
    float sum = 0.0f;
    for (int channel = 0; channel < channels; ++channel) {
        sum += frame[channel];
    }
    const float sample = sum / static_cast<float>(channels) * FULL_SCALE;
    return std::isfinite(sample) ? sample : 0.0f;
}

}  // namespace

AudioClip readAudioFile(const std::string& path) {
    checkIsFile(path);
    SF_INFO info = {};
    const SoundFile file = openSoundFile(path, info);
    const std::size_t channels = static_cast<std::size_t>(info.channels);
    const std::size_t maxSamples =
        static_cast<std::size_t>(info.samplerate) * static_cast<std::size_t>(MAX_CLIP_SECONDS);

    AudioClip clip;
    clip.sampleRateHz = info.samplerate;
    const std::size_t blockFrames = std::max<std::size_t>(1, BLOCK_SAMPLES / channels);
    std::vector<float> block(blockFrames * channels);
    for (;;) {
        const sf_count_t frames =
            sf_readf_float(file.get(), block.data(), static_cast<sf_count_t>(blockFrames));
        if (frames <= 0) {
            break;
        }
        for (std::size_t frame = 0; frame < static_cast<std::size_t>(frames); ++frame) {
            clip.samples.push_back(mixDown(&block[frame * channels], info.channels));
        }
        if (clip.samples.size() > maxSamples) {
            refuse(path, "it holds more than an hour of sound");
        }
    }
    if (clip.samples.empty()) {
        refuse(path, "it holds no sound");
    }
    return clip;
}

AudioClip readRawAudio(std::istream& in, int sampleRateHz, std::size_t maxSamples) {
    AudioClip clip;
    clip.sampleRateHz = sampleRateHz;
    std::vector<char> block(BLOCK_SAMPLES * 2);
    while (in && clip.samples.size() < maxSamples) {
        const std::size_t wanted = std::min(BLOCK_SAMPLES, maxSamples - clip.samples.size());
        in.read(block.data(), static_cast<std::streamsize>(wanted * 2));
        const std::size_t samples = static_cast<std::size_t>(in.gcount()) / 2;
        for (std::size_t index = 0; index < samples; ++index) {
            const unsigned low = static_cast<unsigned char>(block[index * 2]);
            const unsigned high = static_cast<unsigned char>(block[index * 2 + 1]);
            const int value = static_cast<int>(low | (high << 8U));
            clip.samples.push_back(static_cast<float>(value < 0x8000 ? value : value - 0x10000));
        }
    }
    if (clip.samples.empty()) {
        throw UsageError("cannot read standard input: it holds no sound");
    }
    return clip;
}

}  // namespace Cli
