#include "WavHead.h"

#include <cstring>

namespace Cli {

namespace {

const std::size_t FORM_BYTES = 12;
const std::size_t CHUNK_HEAD_BYTES = 8;
const std::size_t FORMAT_BYTES = 16;
const std::size_t BYTES_PER_SECOND_OFFSET = 8;
// Writers into pipes leave 0x7FFFF000 or more, rounded to whole blocks in several ways.
const std::uint32_t LEAST_PLACEHOLDER = 0x7FFFF000;
// A header of more chunks is not sound.
const int CHUNKS_MAX = 1000;

std::uint32_t numberAt(const char* bytes) {
    std::uint32_t number = 0;
    for (std::size_t index = 4; index > 0; --index) {
        number = number << 8U | static_cast<unsigned char>(bytes[index - 1]);
    }
    return number;
}

bool hasName(const char* bytes, const char* name) {
    return std::memcmp(bytes, name, 4) == 0;
}

}  // namespace

std::optional<WavHead> readWavHead(std::istream& in) {
    char form[FORM_BYTES];
    if (!in.read(form, sizeof form) || !hasName(form, "RIFF") || !hasName(form + 8, "WAVE")) {
        return std::nullopt;
    }
    WavHead head;
    head.soundOffset = FORM_BYTES;
    char chunk[CHUNK_HEAD_BYTES];
    for (int count = 0; count < CHUNKS_MAX && in.read(chunk, sizeof chunk); ++count) {
        const std::uint32_t size = numberAt(chunk + 4);
        head.soundOffset += CHUNK_HEAD_BYTES;
        if (hasName(chunk, "data")) {
            head.soundBytes = size;
            head.isOpenEnded = size >= LEAST_PLACEHOLDER;
            return head;
        }
        char format[FORMAT_BYTES];
        if (hasName(chunk, "fmt ") && size >= sizeof format && in.read(format, sizeof format)) {
            head.bytesPerSecond = numberAt(format + BYTES_PER_SECOND_OFFSET);
        }
        // Chunks begin at even offsets.
        head.soundOffset += std::uint64_t{size} + size % 2;
        in.seekg(static_cast<std::streamoff>(head.soundOffset));
    }
    return std::nullopt;
}

}  // namespace Cli
