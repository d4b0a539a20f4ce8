#include "cli/AudioFile.h"

#include <gmock/gmock.h>
#include <sndfile.h>

#include <array>
#include <atomic>
#include <set>
#include <thread>

#include "SoundFiles.h"
#include "cli/UsageError.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::AudioClip;
using Cli::readAudioFile;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::FloatNear;
using ::testing::IsEmpty;
using ::testing::MatchesRegex;
using ::testing::StartsWith;
using TestSupport::LogCapture;
using TestSupport::ScratchDirectory;
using TestSupport::sine;
using TestSupport::writeSoundFile;

const int WAV = SF_FORMAT_WAV | SF_FORMAT_PCM_16;

/** The message with which a path is refused; empty when it is not. */
std::string refusal(const std::string& path) {
    try {
        readAudioFile(path);
    } catch (const Cli::UsageError& error) {
        return error.what();
    }
    return "";
}

TEST(AudioFile, Keeps16BitMonoSamplesAsTheyAre) {
    const ScratchDirectory directory;
    const std::string path = directory.path("a.wav");
    ASSERT_TRUE(writeSoundFile(path, WAV, 16000, 1, {0, 1, -1, 32767, -32768, 12345}));
    const AudioClip clip = readAudioFile(path);
    EXPECT_EQ(clip.sampleRateHz, 16000);
    EXPECT_THAT(clip.samples, ElementsAre(0, 1, -1, 32767, -32768, 12345));
}

TEST(AudioFile, MixesStereoDownToTheMean) {
    const ScratchDirectory directory;
    const std::string path = directory.path("stereo.wav");
    ASSERT_TRUE(writeSoundFile(path, WAV, 44100, 2, {100, 300, -50, 50, 32767, 32767}));
    const AudioClip clip = readAudioFile(path);
    EXPECT_EQ(clip.sampleRateHz, 44100);
    EXPECT_THAT(clip.samples, ElementsAre(200, 0, 32767));
}

TEST(AudioFile, MixesManyChannels) {
    const ScratchDirectory directory;
    const std::string path = directory.path("eight.wav");
    ASSERT_TRUE(writeSoundFile(path, SF_FORMAT_WAVEX | SF_FORMAT_PCM_16, 48000, 8,
                               {80, 0, 0, 0, 0, 0, 0, 0, 8, 8, 8, 8, 8, 8, 8, 8}));
    EXPECT_THAT(readAudioFile(path).samples, ElementsAre(10, 8));
}

TEST(AudioFile, ReadsEightBitSound) {
    const ScratchDirectory directory;
    const std::string path = directory.path("eight-bit.wav");
    ASSERT_TRUE(writeSoundFile(path, SF_FORMAT_WAV | SF_FORMAT_PCM_U8, 8000, 1,
                               {0, 256 * 100, -256 * 100}));
    const AudioClip clip = readAudioFile(path);
    EXPECT_EQ(clip.sampleRateHz, 8000);
    EXPECT_THAT(clip.samples,
                ElementsAre(FloatNear(0, 256), FloatNear(25600, 256), FloatNear(-25600, 256)));
}

TEST(AudioFile, ReadsFloatSoundAndSilencesWhatIsNoNumber) {
    const ScratchDirectory directory;
    const std::string path = directory.path("float.wav");
    SF_INFO info = {};
    info.format = SF_FORMAT_WAV | SF_FORMAT_FLOAT;
    info.samplerate = 22050;
    info.channels = 1;
    SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
    ASSERT_NE(file, nullptr);
    const float samples[] = {0.5F, std::numeric_limits<float>::quiet_NaN(),
                             std::numeric_limits<float>::infinity(), -0.25F};
    ASSERT_EQ(sf_write_float(file, samples, 4), 4);
    sf_close(file);
    EXPECT_THAT(readAudioFile(path).samples, ElementsAre(16384, 0, 0, -8192));
}

TEST(AudioFile, ReadsOtherContainers) {
    const ScratchDirectory directory;
    const std::string aiff = directory.path("a.aiff");
    ASSERT_TRUE(writeSoundFile(aiff, SF_FORMAT_AIFF | SF_FORMAT_PCM_24, 16000, 1, {1000, -1000}));
    EXPECT_THAT(readAudioFile(aiff).samples, ElementsAre(1000, -1000));
    const std::string flac = directory.path("a.flac");
    ASSERT_TRUE(writeSoundFile(flac, SF_FORMAT_FLAC | SF_FORMAT_PCM_16, 11025, 1, sine(11025, 1)));
    EXPECT_EQ(readAudioFile(flac).samples.size(), 11025U);
}

TEST(AudioFile, GivesTheSoundThatIsLeftOfACutFileAndSaysSo) {
    const LogCapture log;
    const ScratchDirectory directory;
    const std::string whole = directory.path("whole.wav");
    ASSERT_TRUE(writeSoundFile(whole, WAV, 16000, 1, std::vector<int16_t>(1600, 7)));
    const std::string bytes = ScratchDirectory::read(whole);
    ASSERT_EQ(bytes.size(), 44U + 3200U);
    EXPECT_EQ(readAudioFile(whole).samples.size(), 1600U);
    EXPECT_THAT(log.messages(), IsEmpty());
    const std::string cut = directory.write("cut.wav", bytes.substr(0, 44 + 1600));
    const AudioClip clip = readAudioFile(cut);
    EXPECT_EQ(clip.samples.size(), 800U);
    EXPECT_THAT(clip.samples, Each(7));
    EXPECT_THAT(log.messages(), ElementsAre(cut + " is cut: it holds 0.050 s of the 0.100 s that "
                                                  "it promises"));
}

TEST(AudioFile, TakesThePlaceholderOfAWriterIntoAPipeForNoLength) {
    const LogCapture log;
    const ScratchDirectory directory;
    const std::string whole = directory.path("whole.wav");
    ASSERT_TRUE(writeSoundFile(whole, WAV, 16000, 1, std::vector<int16_t>(1000, 7)));
    for (const char* const placeholder : {"\xFF\xFF\xFF\xFF", "\xFF\xFF\xFF\x7F"}) {
        std::string bytes = ScratchDirectory::read(whole);
        bytes.replace(4, 4, placeholder, 4);
        bytes.replace(40, 4, placeholder, 4);
        EXPECT_EQ(readAudioFile(directory.write("open.wav", bytes)).samples.size(), 1000U);
    }
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(AudioFile, RefusesAFileThatCannotBeReadToItsEnd) {
    const ScratchDirectory directory;
    const std::string whole = directory.path("whole.flac");
    ASSERT_TRUE(writeSoundFile(whole, SF_FORMAT_FLAC | SF_FORMAT_PCM_16, 16000, 1, sine(16000, 3)));
    std::string bytes = ScratchDirectory::read(whole);
    bytes.resize(bytes.size() / 2);
    const std::string path = directory.write("half.flac", bytes);
    EXPECT_THAT(refusal(path), MatchesRegex("cannot read " + path +
                                            ": only its first 1\\.[0-9]+ s can be read: flac "
                                            "decoder lost sync"));
}

TEST(AudioFile, SaysWhatToDoWithSpeexAndRawSound) {
    const ScratchDirectory directory;
    std::string page = "OggS";
    page.resize(28, '\0');
    const std::string speex = directory.write("a.spx", page + "Speex   1.2.1");
    EXPECT_EQ(refusal(speex), "cannot read " + speex +
                                  ": it is Ogg Speex; decode it first, as with speexdec FILE.spx "
                                  "FILE.wav");
    for (const char* const name : {"a.raw", "a.pcm"}) {
        const std::string raw = directory.write(name, TestSupport::rawBytes(sine(16000, 0.1)));
        EXPECT_EQ(refusal(raw), "cannot read " + raw +
                                    ": it is not sound of a known format; pipe raw sound as with "
                                    "--file - --rate HZ < FILE");
    }
}

TEST(AudioFile, SaysWhenFramesOfACompressedFileAreMissing) {
    const LogCapture log;
    const ScratchDirectory directory;
    const std::string whole = directory.path("whole.mp3");
    ASSERT_TRUE(
        writeSoundFile(whole, SF_FORMAT_MPEG | SF_FORMAT_MPEG_LAYER_III, 16000, 1, sine(16000, 3)));
    EXPECT_EQ(readAudioFile(whole).samples.size(), 48000U);
    EXPECT_THAT(log.messages(), IsEmpty());
    std::string bytes = ScratchDirectory::read(whole);
    bytes.resize(bytes.size() / 2);
    const AudioClip clip = readAudioFile(directory.write("cut.mp3", bytes));
    EXPECT_LT(clip.samples.size(), 32000U);
    ASSERT_EQ(log.messages().size(), 1U);
    EXPECT_THAT(log.messages().front(), EndsWith(" of the 3.000 s that it promises"));
}

TEST(AudioFile, RefusesAFileThatIsCutInItsHeader) {
    const ScratchDirectory directory;
    const std::string whole = directory.path("whole.wav");
    ASSERT_TRUE(writeSoundFile(whole, WAV, 16000, 1, std::vector<int16_t>(1000, 7)));
    const std::string path =
        directory.write("cut.wav", ScratchDirectory::read(whole).substr(0, 20));
    EXPECT_THAT(refusal(path), StartsWith("cannot read " + path + ": "));
}

TEST(AudioFile, RefusesAFileWithoutSamples) {
    const ScratchDirectory directory;
    const std::string path = directory.path("silent.wav");
    ASSERT_TRUE(writeSoundFile(path, WAV, 16000, 1, {}));
    EXPECT_EQ(refusal(path), "cannot read " + path + ": it holds no sound");
}

TEST(AudioFile, RefusesAnEmptyFile) {
    const ScratchDirectory directory;
    const std::string path = directory.write("empty.wav", "");
    EXPECT_EQ(refusal(path), "cannot read " + path + ": the file is empty");
}

TEST(AudioFile, RefusesWhatIsNotSound) {
    const ScratchDirectory directory;
    const std::string path = directory.write("letter.txt", "Dear Sir or Madam, this is no sound.");
    EXPECT_EQ(refusal(path), "cannot read " + path + ": it is not sound of a known format");
}

TEST(AudioFile, SaysWhyWhileOtherThreadsOpenFiles) {
    const ScratchDirectory directory;
    const std::string sound = directory.path("a.wav");
    ASSERT_TRUE(writeSoundFile(sound, WAV, 16000, 1, {1, 2, 3}));
    const std::string letter = directory.write("letter.wav", "Dear Sir or Madam, no sound.");
    std::atomic<bool> isOver{false};
    const auto read = [&] {
        while (!isOver) {
            readAudioFile(sound);
        }
    };
    std::array<std::thread, 3> others = {std::thread(read), std::thread(read), std::thread(read)};
    std::set<std::string> refusals;
    for (int turn = 0; turn < 2000; ++turn) {
        refusals.insert(refusal(letter));
    }
    isOver = true;
    for (std::thread& other : others) {
        other.join();
    }
    EXPECT_THAT(refusals,
                ElementsAre("cannot read " + letter + ": it is not sound of a known format"));
}

TEST(AudioFile, RefusesAMissingFileAndADirectory) {
    const ScratchDirectory directory;
    const std::string missing = directory.path("nowhere.wav");
    EXPECT_EQ(refusal(missing), "cannot read " + missing + ": No such file or directory");
    EXPECT_EQ(refusal(directory.path()), "cannot read " + directory.path() + ": it is a directory");
}

TEST(AudioFile, RefusesAnAbsurdSampleRate) {
    const ScratchDirectory directory;
    const std::string path = directory.path("slow.wav");
    ASSERT_TRUE(writeSoundFile(path, WAV, 10, 1, {1, 2, 3}));
    EXPECT_EQ(refusal(path), "cannot read " + path + ": its sample rate of 10 Hz is out of range");
}

}  // namespace
