#include "cli/AudioStream.h"

#include <gmock/gmock.h>
#include <sndfile.h>

#include <sstream>

#include "SoundFiles.h"
#include "cli/UsageError.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Cli::AudioClip;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::LogCapture;
using TestSupport::ScratchDirectory;

/** The bytes of a WAV file whose samples are all 7. */
std::string wavBytes(int sampleRateHz, std::size_t samples) {
    const ScratchDirectory directory;
    const std::string path = directory.path("a.wav");
    EXPECT_TRUE(TestSupport::writeSoundFile(path, SF_FORMAT_WAV | SF_FORMAT_PCM_16, sampleRateHz, 1,
                                            std::vector<int16_t>(samples, 7)));
    return ScratchDirectory::read(path);
}

AudioClip readStream(const std::string& bytes, int rawRateHz, int maxSeconds) {
    std::istringstream in(bytes);
    return Cli::readAudioStream(in, rawRateHz, maxSeconds);
}

/** The message with which a stream is refused; empty when it is not. */
std::string refusal(const std::string& bytes) {
    try {
        readStream(bytes, 16000, 1);
    } catch (const Cli::UsageError& error) {
        return error.what();
    }
    return "";
}

TEST(AudioStream, ReadsRawSoundFromItsFirstByte) {
    const AudioClip clip = readStream(std::string("\x01\x00\xFF\xFF\x00\x80\xFF\x7F", 8), 8000, 1);
    EXPECT_EQ(clip.sampleRateHz, 8000);
    EXPECT_THAT(clip.samples, ElementsAre(1, -1, -32768, 32767));
    EXPECT_EQ(readStream(std::string(20000, '\1'), 8000, 1).samples.size(), 8000U);
    EXPECT_EQ(readStream(std::string("RIFF"), 8000, 1).samples.size(), 2U);
}

TEST(AudioStream, ReadsAWavFileAtItsOwnRateWithoutItsHeader) {
    const LogCapture log;
    const AudioClip clip = readStream(wavBytes(8000, 40000), 16000, 60);
    EXPECT_EQ(clip.sampleRateHz, 8000);
    EXPECT_EQ(clip.samples.size(), 40000U);
    EXPECT_THAT(clip.samples, Each(7));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(AudioStream, TakesNoMoreOfAWavFileThanAskedFor) {
    const LogCapture log;
    const std::string bytes = wavBytes(44100, 200000);
    std::istringstream in(bytes);
    EXPECT_EQ(Cli::readAudioStream(in, 16000, 2).samples.size(), 88200U);
    EXPECT_EQ(in.tellg(), std::istringstream::pos_type(44 + 88200 * 2));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(AudioStream, ReadsAWavFileWhoseWriterDidNotKnowItsLength) {
    const LogCapture log;
    std::string bytes = wavBytes(16000, 1000);
    bytes.replace(4, 4, "\xFF\xFF\xFF\xFF").replace(40, 4, "\xFF\xFF\xFF\xFF");
    EXPECT_EQ(readStream(bytes, 16000, 60).samples.size(), 1000U);
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(AudioStream, SaysWhenAWavFileIsCut) {
    const LogCapture log;
    EXPECT_EQ(readStream(wavBytes(16000, 16000).substr(0, 44 + 8000), 16000, 60).samples.size(),
              4000U);
    EXPECT_THAT(log.messages(), ElementsAre("standard input is cut: it holds 0.250 s of the 1.000 "
                                            "s that it promises"));
}

TEST(AudioStream, RefusesWhatIsNeitherRawSoundNorAWholeWavFile) {
    EXPECT_EQ(refusal(""), "cannot read standard input: it holds no sound");
    EXPECT_EQ(refusal(wavBytes(16000, 100).substr(0, 30)),
              "cannot read standard input: no sound begins in the first 64 KiB of the WAV file");
    EXPECT_EQ(refusal(wavBytes(16000, 0)), "cannot read standard input: it holds no sound");
    for (const char* const magic : {"fLaC", "OggS", "FORM", "RF64"}) {
        EXPECT_EQ(refusal(magic + std::string(100, 'x')),
                  "cannot read standard input: it is a sound file, but not a WAV; name it with "
                  "--file FILE");
    }
}

TEST(RawAudio, ReadsSignedLittleEndianSamples) {
    std::istringstream in(std::string("\x01\x00\xFF\xFF\x00\x80\xFF\x7F", 8));
    const AudioClip clip = Cli::readRawAudio(in, 8000, 100);
    EXPECT_EQ(clip.sampleRateHz, 8000);
    EXPECT_THAT(clip.samples, ElementsAre(1, -1, -32768, 32767));
}

TEST(RawAudio, DropsAnOddByteAtTheEnd) {
    std::istringstream in(std::string("\x01\x00\x02", 3));
    EXPECT_THAT(Cli::readRawAudio(in, 8000, 100).samples, ElementsAre(1));
}

TEST(RawAudio, TakesNoMoreThanAskedFor) {
    std::istringstream in(std::string(1000, '\1'));
    EXPECT_EQ(Cli::readRawAudio(in, 8000, 7).samples.size(), 7U);
    EXPECT_EQ(in.tellg(), std::istringstream::pos_type(14));
}

TEST(RawAudio, RefusesAnEmptyStream) {
    std::istringstream in("");
    EXPECT_THROW(Cli::readRawAudio(in, 8000, 100), Cli::UsageError);
    std::istringstream oneByte("x");
    EXPECT_THROW(Cli::readRawAudio(oneByte, 8000, 100), Cli::UsageError);
}

}  // namespace
