#include "tools/WavBytes.h"

namespace Tools {

namespace {

constexpr uint32_t HEAD_BYTES = 44;
/** Of the head, what comes before the length of the rest. */
constexpr uint32_t RIFF_BYTES = 8;

void appendNumber(std::string& bytes, uint32_t number, int count) {
    for (int index = 0; index < count; ++index) {
        bytes += static_cast<char>(number & 0xFFU);
        number >>= 8U;
    }
}

}  // namespace

std::string makeWav(const std::vector<int16_t>& samples, unsigned sampleRateHz) {
    const auto dataSize = static_cast<uint32_t>(samples.size() * 2);
    std::string bytes;
    bytes.reserve(HEAD_BYTES + std::size_t{dataSize});
    bytes += "RIFF";
    appendNumber(bytes, HEAD_BYTES - RIFF_BYTES + dataSize, 4);
    bytes += "WAVEfmt ";
    appendNumber(bytes, 16, 4);
    appendNumber(bytes, 1, 2);
    appendNumber(bytes, 1, 2);
    appendNumber(bytes, sampleRateHz, 4);
    appendNumber(bytes, sampleRateHz * 2, 4);
    appendNumber(bytes, 2, 2);
    appendNumber(bytes, 16, 2);
    bytes += "data";
    appendNumber(bytes, dataSize, 4);
    for (const int16_t sample : samples) {
        appendNumber(bytes, static_cast<uint16_t>(sample), 2);
    }
    return bytes;
}

}  // namespace Tools
