#include "util/impl/WavHeader.h"

#include <algorithm>
#include <limits>

namespace Util {

namespace {

constexpr std::uint32_t LARGEST = std::numeric_limits<std::uint32_t>::max();
constexpr std::uint32_t FMT_SIZE = 16;
constexpr std::uint32_t INTEGER_PCM = 1;

/** Appends fields. */
class Writer {
  public:
    explicit Writer(WavHeader::Bytes& target) : at(target.begin()) {}

    void text(const char* fourLetters) { at = std::copy_n(fourLetters, 4, at); }

    void number32(std::uint32_t value) {
        const WavHeader::Number bytes = WavHeader::littleEndian(value);
        at = std::copy(bytes.begin(), bytes.end(), at);
    }

    void number16(std::uint32_t value) {
        const WavHeader::Number bytes = WavHeader::littleEndian(value);
        at = std::copy_n(bytes.begin(), 2, at);
    }

  private:
    WavHeader::Bytes::iterator at;
};

}  // namespace

WavHeader::Number WavHeader::littleEndian(std::uint32_t value) {
    Number bytes{};
    for (std::uint8_t& byte : bytes) {
        byte = static_cast<std::uint8_t>(value & 0xFFU);
        value >>= 8U;
    }
    return bytes;
}

WavHeader::Bytes WavHeader::build(const Sound::SoundDataInfo& info) {
    const auto channels = static_cast<std::uint32_t>(info.getChannelCount());
    const auto sampleRate = static_cast<std::uint32_t>(info.getSampleRate());
    const auto sampleSize = static_cast<std::uint32_t>(info.getSampleSize());
    Bytes header{};
    Writer writer(header);
    writer.text("RIFF");
    writer.number32(0);
    writer.text("WAVE");
    writer.text("fmt ");
    writer.number32(FMT_SIZE);
    writer.number16(INTEGER_PCM);
    writer.number16(channels);
    writer.number32(sampleRate);
    writer.number32(sampleSize * (sampleRate * channels));
    writer.number16(channels * sampleSize);
    writer.number16(sampleSize * 8);
    writer.text("data");
    writer.number32(0);
    return header;
}

std::uint32_t WavHeader::chunkSize(std::uint32_t dataBytes) {
    constexpr std::uint32_t REST = SIZE - 8;
    return dataBytes > LARGEST - REST ? LARGEST : dataBytes + REST;
}

std::uint32_t WavHeader::grow(std::uint32_t dataBytes, int written) {
    const auto more = static_cast<std::uint32_t>(written);
    return dataBytes > LARGEST - more ? LARGEST : dataBytes + more;
}

}  // namespace Util
