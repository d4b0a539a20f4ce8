#include "AudioStream.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <optional>
#include <sstream>
#include <vector>

#include "SoundDecoder.h"
#include "WavHead.h"

namespace Cli {

namespace {

const char* const STREAM_NAME = "standard input";
const std::size_t BLOCK_SAMPLES = 65536;
const std::size_t MAGIC_BYTES = 12;
const std::size_t STREAM_HEAD_BYTES = 65536;
const std::size_t STREAM_MAX_BYTES = std::size_t{1} << 30U;

/** A sound file in memory, as libsndfile reads it. */
struct MemoryFile {
    const std::string& bytes;
    sf_count_t position = 0;

    static MemoryFile& of(void* self) { return *static_cast<MemoryFile*>(self); }
    sf_count_t size() const { return static_cast<sf_count_t>(bytes.size()); }

    static sf_count_t getLength(void* self) { return of(self).size(); }
    static sf_count_t tell(void* self) { return of(self).position; }
    static sf_count_t write(const void* /*data*/, sf_count_t /*count*/, void* /*self*/) {
        return 0;
    }
    static sf_count_t seek(sf_count_t offset, int whence, void* self) {
        MemoryFile& file = of(self);
        const sf_count_t origin =
            whence == SEEK_CUR ? file.position : (whence == SEEK_END ? file.size() : 0);
        file.position = std::min(std::max<sf_count_t>(0, origin + offset), file.size());
        return file.position;
    }
    static sf_count_t read(void* data, sf_count_t count, void* self) {
        MemoryFile& file = of(self);
        const sf_count_t taken = std::min(count, file.size() - file.position);
        std::memcpy(data, file.bytes.data() + file.position, static_cast<std::size_t>(taken));
        file.position += taken;
        return taken;
    }
};

/** Appends what the stream holds until there are `size` bytes. */
void fill(std::string& bytes, std::istream& in, std::size_t size) {
    std::vector<char> block(BLOCK_SAMPLES);
    while (in && bytes.size() < size) {
        in.read(block.data(),
                static_cast<std::streamsize>(std::min(block.size(), size - bytes.size())));
        bytes.append(block.data(), static_cast<std::size_t>(in.gcount()));
    }
}

/** @param bytes what was taken from the stream before */
AudioClip readWavStream(std::istream& in, std::string bytes, int maxSeconds) {
    fill(bytes, in, STREAM_HEAD_BYTES);
    std::istringstream begin(bytes);
    const std::optional<WavHead> head = readWavHead(begin);
    if (!head) {
        refuseSound(STREAM_NAME, "no sound begins in the first 64 KiB of the WAV file");
    }
    const std::uint64_t wanted =
        head->soundOffset + std::uint64_t{head->bytesPerSecond} * static_cast<unsigned>(maxSeconds);
    fill(bytes, in, static_cast<std::size_t>(std::min<std::uint64_t>(wanted, STREAM_MAX_BYTES)));

    MemoryFile memory{bytes};
    SF_VIRTUAL_IO access = {&MemoryFile::getLength, &MemoryFile::seek, &MemoryFile::read,
                            &MemoryFile::write, &MemoryFile::tell};
    SF_INFO info = {};
    OpenFailure failure;
    const SoundFile file =
        openSound([&] { return sf_open_virtual(&access, SFM_READ, &info, &memory); }, failure);
    if (!file) {
        refuseSound(STREAM_NAME, failure.reason);
    }
    const std::size_t maxSamples = samplesIn(maxSeconds, info.samplerate);
    AudioClip clip = decodeSound(file.get(), info, STREAM_NAME, maxSamples);
    clip.samples.resize(std::min(clip.samples.size(), maxSamples));
    if (in.eof()) {
        warnOfCutWav(STREAM_NAME, *head, bytes.size(), clip);
    }
    return clip;
}

void appendSamples(AudioClip& clip, const char* bytes, std::size_t samples) {
    for (std::size_t index = 0; index < samples; ++index) {
        const unsigned low = static_cast<unsigned char>(bytes[index * 2]);
        const unsigned high = static_cast<unsigned char>(bytes[index * 2 + 1]);
        const int value = static_cast<int>(low | (high << 8U));
        clip.samples.push_back(static_cast<float>(value < 0x8000 ? value : value - 0x10000));
    }
}

}  // namespace

AudioClip readRawAudio(std::istream& in, int sampleRateHz, std::size_t maxSamples,
                       const std::string& head) {
    AudioClip clip;
    clip.sampleRateHz = sampleRateHz;
    appendSamples(clip, head.data(), head.size() / 2);
    std::vector<char> block(BLOCK_SAMPLES * 2);
    while (in && clip.samples.size() < maxSamples) {
        const std::size_t wanted = std::min(BLOCK_SAMPLES, maxSamples - clip.samples.size());
        in.read(block.data(), static_cast<std::streamsize>(wanted * 2));
        appendSamples(clip, block.data(), static_cast<std::size_t>(in.gcount()) / 2);
    }
    if (clip.samples.empty()) {
        refuseSound(STREAM_NAME, "it holds no sound");
    }
    return clip;
}

AudioClip readAudioStream(std::istream& in, int rawRateHz, int maxSeconds) {
    std::string head;
    fill(head, in, MAGIC_BYTES);
    if (head.size() == MAGIC_BYTES && head.compare(0, 4, "RIFF") == 0 &&
        head.compare(8, 4, "WAVE") == 0) {
        return readWavStream(in, head, maxSeconds);
    }
    for (const char* const magic : {"RF64", "fLaC", "OggS", "FORM"}) {
        if (head.compare(0, 4, magic) == 0) {
            refuseSound(STREAM_NAME, "it is a sound file, but not a WAV; name it with --file FILE");
        }
    }
    return readRawAudio(in, rawRateHz, samplesIn(maxSeconds, rawRateHz), head);
}

}  // namespace Cli
