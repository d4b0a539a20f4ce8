#include "support/OggSpeexDecoder.h"

#include <algorithm>
#include <cstring>
#include <fstream>
#include <iterator>

#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace TestSupport {

namespace {

const std::size_t PAGE_HEADER_SIZE = 27;
const std::size_t CHECKSUM_OFFSET = 22;
const std::size_t SPEEX_HEADER_SIZE = 80;

uint32_t readWord(const unsigned char* bytes) {
    return bytes[0] | static_cast<uint32_t>(bytes[1]) << 8 | static_cast<uint32_t>(bytes[2]) << 16 |
           static_cast<uint32_t>(bytes[3]) << 24;
}

/** The checksum of a page whose checksum field counts as zero. */
uint32_t checksumOf(const unsigned char* page, std::size_t size) {
    uint32_t sum = 0;
    for (std::size_t i = 0; i < size; ++i) {
        const bool isField = i >= CHECKSUM_OFFSET && i < CHECKSUM_OFFSET + 4;
        sum ^= (isField ? 0U : page[i]) << 24;
        for (int bit = 0; bit < 8; ++bit) {
            sum = (sum & 0x80000000U) != 0 ? sum << 1 ^ 0x04C11DB7U : sum << 1;
        }
    }
    return sum;
}

/** Reads the page at `bytes`; its size is 0 when none is there as a whole. */
OggPage readPage(const unsigned char* bytes, std::size_t available) {
    OggPage page;
    if (available < PAGE_HEADER_SIZE || std::memcmp(bytes, "OggS", 5) != 0) {
        return page;
    }
    const std::size_t segmentCount = bytes[26];
    std::size_t position = PAGE_HEADER_SIZE + segmentCount;
    if (available < position) {
        return page;
    }
    Bytes packet;
    for (std::size_t i = 0; i < segmentCount; ++i) {
        const std::size_t length = bytes[PAGE_HEADER_SIZE + i];
        if (available < position + length) {
            return page;
        }
        packet.insert(packet.end(), bytes + position, bytes + position + length);
        position += length;
        if (length < 255) {
            page.packets.push_back(packet);
            packet.clear();
        }
    }
    page.continued = (bytes[5] & 1U) != 0;
    page.first = (bytes[5] & 2U) != 0;
    page.last = (bytes[5] & 4U) != 0;
    page.granulePosition = static_cast<int64_t>(readWord(bytes + 6) |
                                                static_cast<uint64_t>(readWord(bytes + 10)) << 32);
    page.serialNumber = readWord(bytes + 14);
    page.sequenceNumber = readWord(bytes + 18);
    page.checksumRight = readWord(bytes + CHECKSUM_OFFSET) == checksumOf(bytes, position);
    page.sizeInBytes = position;
    return page;
}

void writeFile(const std::string& path, const Bytes& bytes) {
    std::ofstream file(path, std::ios::binary);
    std::copy(bytes.begin(), bytes.end(), std::ostreambuf_iterator<char>(file));
}

std::vector<int16_t> readSamples(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    const Bytes bytes{std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    std::vector<int16_t> samples(bytes.size() / 2);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = static_cast<int16_t>(bytes[2 * i] | bytes[2 * i + 1] << 8);
    }
    return samples;
}

}  // namespace

std::vector<OggPage> readOggPages(const Bytes& stream) {
    std::vector<OggPage> pages;
    for (std::size_t position = 0; position < stream.size();) {
        OggPage page = readPage(stream.data() + position, stream.size() - position);
        if (page.sizeInBytes == 0) {
            break;
        }
        position += page.sizeInBytes;
        pages.push_back(std::move(page));
    }
    return pages;
}

SpeexHeaderFields readSpeexHeader(const Bytes& packet) {
    SpeexHeaderFields fields;
    if (packet.size() != SPEEX_HEADER_SIZE || std::memcmp(packet.data(), "Speex   ", 8) != 0) {
        return fields;
    }
    const auto field = [&packet](std::size_t offset) {
        return static_cast<int>(readWord(packet.data() + offset));
    };
    fields.valid = true;
    fields.rate = field(36);
    fields.mode = field(40);
    fields.channels = field(48);
    fields.frameSize = field(56);
    fields.framesPerPacket = field(64);
    return fields;
}

DecodedSound decodeWithSpeexdec(const Bytes& stream) {
    const ScratchDirectory directory;
    writeFile(directory.path("in.spx"), stream);
    const ChildProcess::Result result = ChildProcess::run(
        {"speexdec", "--no-enh", directory.path("in.spx"), directory.path("out.raw")});
    return {result.exitStatus == 0, result.output, readSamples(directory.path("out.raw"))};
}

DecodedSound decodeWithFfmpeg(const Bytes& stream, int64_t endSample) {
    const ScratchDirectory directory;
    writeFile(directory.path("in.spx"), stream);
    std::vector<std::string> arguments = {
        "ffmpeg", "-nostdin", "-v", "error", "-copyts", "-i", directory.path("in.spx")};
    if (endSample >= 0) {
        arguments.insert(arguments.end(),
                         {"-af", "atrim=start_pts=0:end_pts=" + std::to_string(endSample)});
    }
    arguments.insert(arguments.end(), {"-f", "s16le", directory.path("out.raw")});
    const ChildProcess::Result result = ChildProcess::run(arguments);
    return {result.exitStatus == 0, result.output, readSamples(directory.path("out.raw"))};
}

}  // namespace TestSupport
