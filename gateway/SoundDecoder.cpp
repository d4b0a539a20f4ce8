#include "gateway/SoundDecoder.h"

#include <algorithm>

namespace Gateway {

namespace {

const std::string OGG_MAGIC = "OggS";

}  // namespace

SoundDecoder::SoundDecoder(const AudioFormat& soundFormat, unsigned outputRateHz)
    : format(soundFormat), outputRate(outputRateHz) {
    if (format.codec == AudioFormat::Codec::SPEEX) {
        speex = std::make_unique<SpeexStreamDecoder>();
        beginningKnown = true;
    }
}

SoundDecoder::~SoundDecoder() = default;

std::string SoundDecoder::write(const char* data, std::size_t size, std::vector<int16_t>& output) {
    if (beginningKnown) {
        return decode(data, size, output);
    }
    beginning.append(data, size);
    const std::size_t compared = std::min(beginning.size(), OGG_MAGIC.size());
    const bool mayBeOgg = beginning.compare(0, compared, OGG_MAGIC, 0, compared) == 0;
    if (mayBeOgg && compared < OGG_MAGIC.size()) {
        return std::string();
    }
    if (mayBeOgg) {
        speex = std::make_unique<SpeexStreamDecoder>();
    }
    beginningKnown = true;
    return decode(beginning.data(), beginning.size(), output);
}

std::string SoundDecoder::decode(const char* data, std::size_t size, std::vector<int16_t>& output) {
    std::vector<int16_t> samples;
    std::string reason;
    if (speex) {
        reason = speex->write(reinterpret_cast<const unsigned char*>(data), size, samples);
    } else {
        readPcm(data, size, samples);
    }
    hasBytes = hasBytes || size > 0;
    if (!resampler && getInputRateHz() != 0) {
        resampler = std::make_unique<Tools::Resampler>(getInputRateHz(), outputRate);
    }
    if (resampler) {
        resampler->write(samples.data(), samples.size(), output);
    }
    return reason;
}

std::string SoundDecoder::finish(std::vector<int16_t>& output) {
    if (!beginningKnown) {
        beginningKnown = true;
        decode(beginning.data(), beginning.size(), output);
    }
    if (resampler) {
        resampler->finish(output);
    }
    if (speex && hasBytes && speex->getRateHz() == 0) {
        return "the sound holds no Speex header";
    }
    return std::string();
}

unsigned SoundDecoder::getInputRateHz() const {
    return speex ? speex->getRateHz() : format.rateHz;
}

std::string SoundDecoder::getRemark() const {
    if (speex && speex->getDamagedPackets() > 0) {
        return std::to_string(speex->getDamagedPackets()) + " damaged packets";
    }
    return pending >= 0 ? "half a sample at the end" : "";
}

void SoundDecoder::readPcm(const char* data, std::size_t size, std::vector<int16_t>& samples) {
    samples.reserve(size / 2 + 1);
    for (std::size_t i = 0; i < size; ++i) {
        const int byte = static_cast<unsigned char>(data[i]);
        if (pending < 0) {
            pending = byte;
        } else {
            samples.push_back(static_cast<int16_t>(static_cast<uint16_t>(pending | (byte << 8))));
            pending = -1;
        }
    }
}

}  // namespace Gateway
