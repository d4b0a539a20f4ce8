/* One byte, then what should be an Ogg Speex stream: the sound must not depend on how the stream is
 * cut into pieces. An odd first byte mends the pages' check sums, which no mutation would hit. */
#include <ogg/ogg.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "Fuzz.h"
#include "gateway/SoundDecoder.h"
#include "gateway/SpeexStreamDecoder.h"

namespace {

using Fuzz::require;
using Samples = std::vector<int16_t>;

constexpr std::size_t PAGE_HEADER_BYTES = 27;
constexpr std::size_t PIECE_MAX = 700;
constexpr unsigned OUTPUT_RATE = 16000;
/** A frame takes five bits at least and gives 640 samples at most. */
constexpr std::size_t SAMPLES_PER_BYTE_MAX = std::size_t{640} * 2;

/** The whole size of the page that begins at `at`; 0 where there is none. */
std::size_t pageSizeAt(const std::string& stream, std::size_t at, std::size_t& headerSize) {
    if (stream.size() - at < PAGE_HEADER_BYTES || stream.compare(at, 4, "OggS") != 0) {
        return 0;
    }
    const std::size_t segments = static_cast<unsigned char>(stream[at + PAGE_HEADER_BYTES - 1]);
    headerSize = PAGE_HEADER_BYTES + segments;
    std::size_t size = headerSize;
    for (std::size_t i = 0; i < segments && at + PAGE_HEADER_BYTES + i < stream.size(); ++i) {
        size += static_cast<unsigned char>(stream[at + PAGE_HEADER_BYTES + i]);
    }
    return size <= stream.size() - at ? size : 0;
}

void mendCheckSums(std::string& stream) {
    for (std::size_t at = 0; at < stream.size();) {
        std::size_t headerSize = 0;
        const std::size_t size = pageSizeAt(stream, at, headerSize);
        if (size == 0) {
            ++at;
            continue;
        }
        ogg_page page = {};
        page.header = reinterpret_cast<unsigned char*>(&stream[at]);
        page.header_len = static_cast<long>(headerSize);
        page.body = page.header + headerSize;
        page.body_len = static_cast<long>(size - headerSize);
        ogg_page_checksum_set(&page);
        at += size;
    }
}

/** All that a decoder makes of a stream. */
struct Decoded {
    std::string reason;
    std::string remark;
    Samples samples;
    unsigned rateHz = 0;

    bool operator==(const Decoded& other) const {
        return reason == other.reason && remark == other.remark && samples == other.samples &&
               rateHz == other.rateHz;
    }
};

Decoded decodeStream(const std::string& stream, std::size_t piece) {
    Gateway::SpeexStreamDecoder decoder;
    Decoded decoded;
    const auto* const bytes = reinterpret_cast<const unsigned char*>(stream.data());
    for (std::size_t at = 0; at < stream.size() && decoded.reason.empty(); at += piece) {
        decoded.reason =
            decoder.write(bytes + at, std::min(piece, stream.size() - at), decoded.samples);
    }
    decoded.rateHz = decoder.getRateHz();
    decoded.remark = std::to_string(decoder.getDamagedPackets());
    return decoded;
}

/** The same through the decoder of requests, which resamples. */
Decoded decodeSound(const std::string& stream, std::size_t piece, bool isSpeex) {
    Gateway::AudioFormat format;
    format.codec =
        isSpeex ? Gateway::AudioFormat::Codec::SPEEX : Gateway::AudioFormat::Codec::PCM16;
    format.rateHz = isSpeex ? 0 : OUTPUT_RATE;
    Gateway::SoundDecoder decoder(format, OUTPUT_RATE);
    Decoded decoded;
    for (std::size_t at = 0; at < stream.size() && decoded.reason.empty(); at += piece) {
        decoded.reason =
            decoder.write(stream.data() + at, std::min(piece, stream.size() - at), decoded.samples);
    }
    if (decoded.reason.empty()) {
        decoded.reason = decoder.finish(decoded.samples);
    }
    decoded.rateHz = decoder.getInputRateHz();
    decoded.remark = decoder.getRemark();
    return decoded;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Fuzz::Input input(data, size);
    const uint8_t choice = input.takeByte();
    std::string stream = input.takeRest();
    if ((choice & 1U) != 0) {
        mendCheckSums(stream);
    }
    const std::size_t piece = 1 + std::size_t{choice} * 37 % PIECE_MAX;
    const Decoded whole = decodeStream(stream, std::max<std::size_t>(1, stream.size()));
    require(decodeStream(stream, piece) == whole, "pieces do not change the samples");
    require(whole.samples.size() <= stream.size() * SAMPLES_PER_BYTE_MAX,
            "there is no more sound than the bytes can hold");
    require(whole.rateHz == 0 || (whole.rateHz >= 6000 && whole.rateHz <= 48000),
            "the rate is one that can be resampled");
    require(whole.rateHz != 0 || whole.samples.empty(), "there is no sound without a rate");
    const Decoded sound = decodeSound(stream, piece, (choice & 2U) != 0);
    if ((choice & 2U) != 0 && sound.reason.empty()) {
        const uint64_t count = whole.samples.size();
        const uint64_t expected =
            whole.rateHz == 0 ? 0 : (count * OUTPUT_RATE + whole.rateHz / 2) / whole.rateHz;
        require(sound.samples.size() == expected, "resampling keeps the length");
        require(sound.rateHz == whole.rateHz, "a request's decoder sees the same rate");
    }
    return 0;
}
