/* Sound files and buffers of odd formats. The first byte says what is done with the rest. */
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "Fuzz.h"
#include "cli/AudioFile.h"
#include "cli/ClipSamples.h"
#include "cli/SoundInput.h"
#include "cli/UsageError.h"
#include "core/sound/FileRecorder.h"
#include "core/sound/OggSpeexEncoder.h"
#include "core/sound/RecorderFormat.h"
#include "core/util/EventLock.h"
#include "gateway/SpeexStreamDecoder.h"
#include "pal/kd_time.h"
#include "support/AssertCapture.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"
#include "util/WavOutputStream.h"

namespace {

using Fuzz::Input;
using Fuzz::require;
using Samples = std::vector<int16_t>;
using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;

constexpr int BUFFERS_MAX = 6;
constexpr std::size_t HEADER_BYTES = 44;

/** A file that is in memory only, but has a path. */
class MemoryFile {
  public:
    MemoryFile() : descriptor(memfd_create("sound", MFD_CLOEXEC)) {
        require(descriptor >= 0, "there is a file in memory");
    }
    ~MemoryFile() { close(descriptor); }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;

    std::string path() const { return "/proc/self/fd/" + std::to_string(descriptor); }

    void write(const std::string& bytes) const {
        require(
            pwrite(descriptor, bytes.data(), bytes.size(), 0) == static_cast<ssize_t>(bytes.size()),
            "the file takes the input");
    }

    std::string read() const {
        const off_t size = lseek(descriptor, 0, SEEK_END);
        require(size >= 0, "the file has a size");
        std::string bytes(static_cast<std::size_t>(size), '\0');
        require(pread(descriptor, &bytes[0], bytes.size(), 0) == size, "the file can be read");
        return bytes;
    }

  private:
    const int descriptor;
};

std::vector<unsigned char> toBytes(const std::string& text) {
    return {text.begin(), text.end()};
}

Samples toSamples(const std::string& bytes) {
    Samples samples(bytes.size() / 2);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const unsigned low = static_cast<unsigned char>(bytes[2 * i]);
        const unsigned high = static_cast<unsigned char>(bytes[2 * i + 1]);
        samples[i] = static_cast<int16_t>(low | high << 8U);
    }
    return samples;
}

/** A number of a kind that formats have, or any number. */
int takeNumber(Input& input) {
    static constexpr int NUMBERS[] = {0,     1,     2,     3,     4,     8,     -1,
                                      100,   1000,  6000,  7999,  8000,  11025, 16000,
                                      22050, 32000, 44100, 48000, 96000, 384000};
    const std::size_t choice = input.takeBelow(24);
    return choice < std::size(NUMBERS) ? NUMBERS[choice] : static_cast<int>(input.takeWord());
}

SoundDataInfo takeFormat(Input& input) {
    const auto codec = input.takeBelow(8) == 7 ? SoundDataInfo::SPEEX : SoundDataInfo::NONE;
    const uint8_t usual = input.takeByte();
    const int rate = takeNumber(input);
    if ((usual & 1U) != 0) {
        return {codec, 1, rate, 2};
    }
    const int channels = takeNumber(input);
    const int sampleSize = takeNumber(input);
    return {codec, channels, rate, sampleSize, takeNumber(input)};
}

void requireConverted(const Cli::AudioClip& clip, int rate) {
    const Samples samples = Cli::toSamples(clip, rate);
    const auto from = static_cast<uint64_t>(clip.sampleRateHz);
    const uint64_t expected = (clip.samples.size() * static_cast<uint64_t>(rate) + from / 2) / from;
    require(samples.size() == expected, "conversion keeps the length");
}

/** What the command-line tool does with a file. */
void readFile(Input& input) {
    static constexpr int RATES[] = {16000, 8000, 44100, 11025};
    const int rate = RATES[input.takeBelow(std::size(RATES))];
    const MemoryFile file;
    file.write(input.takeRest());
    try {
        const Cli::AudioClip clip = Cli::readAudioFile(file.path());
        require(!clip.samples.empty(), "a clip has sound");
        require(std::all_of(clip.samples.begin(), clip.samples.end(),
                            [](float sample) { return std::isfinite(sample); }),
                "samples are numbers");
        requireConverted(clip, rate);
    } catch (const Cli::UsageError& refused) {
        require(*refused.what() != '\0', "a refusal has a reason");
    }
}

/** What the command-line tool does with standard input: raw sound, unless it is a WAV file. */
void readStream(Input& input) {
    const int rate = takeNumber(input);
    const std::string bytes = input.takeRest();
    std::istringstream stream(bytes);
    try {
        const Samples samples = Cli::loadSound(Cli::STANDARD_INPUT, stream, rate, 1);
        require(samples == toSamples(bytes) || bytes.compare(0, 4, "RIFF") == 0,
                "raw sound is read as it is");
        require(rate >= 8000 && rate <= 44100, "the engine's rates are accepted");
    } catch (const Cli::UsageError& refused) {
        require(*refused.what() != '\0', "a refusal has a reason");
    }
}

/** A number of a header, little-endian. */
uint32_t numberAt(const std::string& bytes, std::size_t at, std::size_t size) {
    uint32_t number = 0;
    for (std::size_t i = size; i > 0; --i) {
        number = number << 8U | static_cast<unsigned char>(bytes[at + i - 1]);
    }
    return number;
}

void writeWav(Input& input) {
    const SoundDataInfo info = takeFormat(input);
    const MemoryFile file;
    std::string sound;
    {
        Util::WavOutputStream stream;
        require(stream.init(file.path(), info), "the dump can be made");
        while (!input.isEmpty()) {
            const std::string piece = input.takeText();
            require(stream.write(piece.data(), static_cast<int>(piece.size())) ==
                        static_cast<int>(piece.size()),
                    "the dump takes every byte");
            sound += piece;
        }
    }
    const std::string written = file.read();
    require(written.size() == HEADER_BYTES + sound.size() && written.substr(HEADER_BYTES) == sound,
            "the dump holds the sound behind its header");
    const auto size = static_cast<uint32_t>(sound.size());
    require(numberAt(written, 4, 4) == size + 36 && numberAt(written, 40, 4) == size,
            "the header has the lengths");
    const auto channels = static_cast<uint32_t>(info.getChannelCount());
    const auto rate = static_cast<uint32_t>(info.getSampleRate());
    const auto sampleSize = static_cast<uint32_t>(info.getSampleSize());
    require(numberAt(written, 22, 2) == (channels & 0xFFFFU) && numberAt(written, 24, 4) == rate &&
                numberAt(written, 28, 4) == rate * channels * sampleSize &&
                numberAt(written, 32, 2) == (channels * sampleSize & 0xFFFFU) &&
                numberAt(written, 34, 2) == (sampleSize * 8 & 0xFFFFU),
            "the header has the format");
    // libsndfile refuses samples that spell these: they look like another format inside.
    const bool isMisleading = sound.compare(0, 4, "OggS") == 0 || sound.compare(0, 4, "wvpk") == 0;
    const bool isReadable =
        channels == 1 && sampleSize == 2 && rate >= 1000 && rate <= 384000 && !isMisleading;
    if (isReadable && sound.size() >= 2) {
        const std::vector<float> read = Cli::readAudioFile(file.path()).samples;
        const Samples samples = toSamples(sound);
        require(
            std::equal(read.begin(), read.end(), samples.begin(), samples.end(),
                       [](float left, int16_t right) { return left == static_cast<float>(right); }),
            "the tool reads the dump as it was written");
    }
}

/** Only the checks of the format may say anything, and only where it is a wrong one. */
void requireExpected(const TestSupport::AssertCapture& asserts, const SoundDataInfo& info) {
    std::set<std::string> admissible;
    if (info.getChannelCount() != 1) {
        admissible.insert("info.getChannelCount() == 1");
    }
    if (info.getSampleSize() != 2) {
        admissible.insert("info.getSampleSize() == 2");
    }
    for (const TestSupport::AssertReport& report : asserts.reports()) {
        require(admissible.count(report.condition) == 1, "only a wrong format breaks an invariant");
    }
}

void detect(Input& input) {
    static const char* const TEXTS[] = {"",
                                        "engine=wrtc",
                                        "framems=30",
                                        "verboselog=2;analyzemson=50",
                                        "engine=wrtc;framems=1",
                                        "framems=7;analyzems=100000",
                                        "minvoicetimems=0;activityon=-1;activityoff=2",
                                        "total=-5;individual=3"};
    const auto detector = Talvox::VoiceActivityDetector::create(TEXTS[input.takeBelow(8)]);
    const SoundDataInfo info = takeFormat(input);
    const TestSupport::AssertCapture asserts;
    detector->setSoundDataInfo(info);
    detector->setSessionMode(input.takeByte() != 0 ? Sound::Recorder::MODE_VOICE_RECOGNITION
                                                   : Sound::Recorder::MODE_GENERAL);
    detector->start();
    Talvox::VoicePowerEstimator estimator;
    estimator.setMode(input.takeByte() & 1);
    for (int i = 0; i < BUFFERS_MAX && !input.isEmpty(); ++i) {
        SoundDataInfo claimed = (input.takeByte() & 1U) != 0 ? info : takeFormat(input);
        claimed.setSampleCount((input.takeByte() & 1U) != 0 ? -1 : takeNumber(input));
        std::vector<unsigned char> bytes = toBytes(input.takeText());
        bytes.resize(bytes.size() * (1 + input.takeBelow(8)), static_cast<unsigned char>(i * 50));
        const SoundDataBuffer buffer(claimed, bytes);
        require(estimator.getEnergy(buffer) >= 0, "energy is a sum of squares");
        estimator.learnNoise(buffer);
        estimator.updatePower(buffer);
        detector->processNoise(buffer);
        detector->process(buffer);
        static_cast<void>(detector->isSpeech());
    }
    requireExpected(asserts, info);
}

/** Decodes what an encoder has made. */
Samples decode(const std::vector<unsigned char>& stream) {
    Gateway::SpeexStreamDecoder decoder;
    Samples samples;
    require(decoder.write(stream.data(), stream.size(), samples).empty(),
            "what was encoded can be decoded");
    require(decoder.getDamagedPackets() == 0, "what was encoded is whole");
    return samples;
}

void encode(Input& input) {
    const SoundDataInfo info = takeFormat(input);
    const int quality = takeNumber(input);
    Sound::OggSpeexEncoder encoder(info, quality, takeNumber(input));
    std::vector<unsigned char> stream;
    const auto take = [&](int most) {
        const boost::shared_ptr<SoundDataBuffer> output = encoder.takeOutput(most);
        const std::size_t size = output ? output->getData().size() : 0;
        require(most < 0 || size <= static_cast<std::size_t>(most), "no more is taken than asked");
        if (size > 0) {
            stream.insert(stream.end(), output->getData().begin(), output->getData().end());
        }
        return size;
    };
    std::size_t samples = 0;
    for (int i = 0; i < BUFFERS_MAX && !input.isEmpty(); ++i) {
        const bool isOther = input.takeByte() == 0xFF;
        SoundDataInfo claimed = isOther ? takeFormat(input) : info;
        claimed.setSampleCount(takeNumber(input));
        std::vector<unsigned char> bytes = toBytes(input.takeText());
        bytes.resize(bytes.size() * (1 + input.takeBelow(8)), static_cast<unsigned char>(i * 50));
        encoder.encode(SoundDataBuffer(claimed, bytes));
        samples += isOther ? 0 : bytes.size() / 2;
        take(static_cast<int>(input.takeByte()));
        if (isOther) {
            // Whether it was of the same format after all does not matter here.
            return;
        }
    }
    encoder.finish();
    while (take(1 + static_cast<int>(input.takeByte())) > 0) {
    }
    const bool isEncodable = info.getCodec() == SoundDataInfo::NONE &&
                             info.getChannelCount() == 1 && info.getSampleSize() == 2 &&
                             info.getSampleRate() > 0;
    require(stream.empty() != isEncodable, "sound of a known format gives a stream");
    if (isEncodable && info.getSampleRate() >= 6000 && info.getSampleRate() <= 48000) {
        require(decode(stream).size() == samples, "a stream has as many samples as went in");
    }
}

/** Collects what a recorder delivers. */
class Collector : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Sound::Recorder* /*recorder*/,
                                boost::shared_ptr<const SoundDataBuffer> buffer) override {
        buffers.push_back(buffer);
    }
    void onRecorderError(Sound::Recorder* /*recorder*/) override {
        Fuzz::fail("a recorder that plays a file has no device to lose");
    }

    std::vector<boost::shared_ptr<const SoundDataBuffer>> buffers;
};

void record(Input& input) {
    const int rate = takeNumber(input);
    const int lengthMs = takeNumber(input);
    // Ten seconds at the highest rate are 8 MB.
    const Sound::RecorderFormat format(rate, lengthMs);
    const bool isLarge = format.isUsable() && format.getByteCount() > 20000;
    const std::size_t count = isLarge ? 1 : input.takeBelow(4);
    const std::string sound = input.takeRest();
    kdUseManualClockKOR(0);
    const Util::EventLock lock;
    const auto recorder = boost::make_shared<Sound::FileRecorder>(toSamples(sound), 0);
    const auto collector = boost::make_shared<Collector>();
    recorder->setSampleRate(rate);
    recorder->setBufferLength(lengthMs);
    recorder->addListener(collector);
    const bool isUsable = recorder->init();
    require(isUsable == format.isUsable(), "a recorder is usable as its format is");
    recorder->startRecording();
    const int64_t playedMs = static_cast<int64_t>(count) * int64_t{std::clamp(lengthMs, 1, 10000)};
    kdAdvanceClockKOR(playedMs * 1000000);
    recorder->stopRecording();
    // The length of a buffer is rounded down to whole samples.
    const int64_t due = isUsable ? playedMs * rate / (int64_t{1000} * format.getSampleCount()) : 0;
    require(static_cast<int64_t>(collector->buffers.size()) == due,
            "a buffer comes with its last sample");
    std::string delivered;
    for (const auto& buffer : collector->buffers) {
        require(buffer->getData().size() == format.getByteCount(), "a buffer has its length");
        delivered.append(buffer->getData().begin(), buffer->getData().end());
    }
    std::string expected = sound.substr(0, sound.size() / 2 * 2);
    expected.resize(delivered.size(), '\0');
    require(delivered == expected, "the file is played, then silence");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Input input(data, size);
    switch (input.takeBelow(8)) {
        case 0:
            readStream(input);
            break;
        case 1:
            writeWav(input);
            break;
        case 2:
            detect(input);
            break;
        case 3:
            encode(input);
            break;
        case 4:
            record(input);
            break;
        default:
            readFile(input);
    }
    return 0;
}
