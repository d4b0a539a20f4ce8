#include "core/sound/OggSpeexEncoder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <string>
#include <vector>

#include "support/ChildProcess.h"
#include "support/LogCapture.h"
#include "support/OggSpeexDecoder.h"
#include "support/TestSound.h"

namespace {

using Sound::OggSpeexEncoder;
using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;
using ::testing::SizeIs;
using TestSupport::Bytes;
using TestSupport::OggPage;
using TestSupport::Samples;

SoundDataInfo formatOf(int sampleRateHz) {
    return SoundDataInfo(SoundDataInfo::NONE, 1, sampleRateHz, 2);
}

/** Moving tones: nowhere silent, so that lost or shifted samples show. */
Samples makeSound(int64_t count) {
    Samples samples = TestSupport::makeSpeechLike(16000, static_cast<int>(count / 16 + 1));
    samples.resize(static_cast<std::size_t>(count));
    return samples;
}

Bytes takeAll(OggSpeexEncoder& encoder) {
    const boost::shared_ptr<SoundDataBuffer> output = encoder.takeOutput(-1);
    return output ? output->getData() : Bytes();
}

Bytes encodeAll(const Samples& samples, int sampleRateHz, int quality,
                int pageFillBytes = OggSpeexEncoder::PAGE_FILL_BYTES_DFLT) {
    OggSpeexEncoder encoder(formatOf(sampleRateHz), quality, pageFillBytes);
    encoder.encode(TestSupport::makeBuffer(samples, sampleRateHz));
    encoder.finish();
    return takeAll(encoder);
}

struct Band {
    int rate;
    int mode;
    int frame;
    int lookAhead;
};

std::ostream& operator<<(std::ostream& out, const Band& band) {
    return out << band.rate << "Hz";
}

std::string nameOf(const ::testing::TestParamInfo<Band>& info) {
    return "At" + std::to_string(info.param.rate) + "Hz";
}

class OggSpeexEncoderAtRate : public ::testing::TestWithParam<Band> {
  protected:
    std::vector<int> lengths() const {
        const int frame = GetParam().frame;
        return {0, 1, frame - 1, frame, frame + 1, 12345, 100000};
    }

    /** From here on a decoder has two pages to cut the codec's delay and the padding at. */
    int exactFrom() const { return GetParam().frame - GetParam().lookAhead; }
};

INSTANTIATE_TEST_SUITE_P(Rates, OggSpeexEncoderAtRate,
                         ::testing::Values(Band{8000, 0, 160, 40}, Band{11025, 0, 160, 40},
                                           Band{12499, 0, 160, 40}, Band{12500, 1, 320, 143},
                                           Band{16000, 1, 320, 143}, Band{22050, 1, 320, 143},
                                           Band{24999, 1, 320, 143}, Band{25000, 2, 640, 349},
                                           Band{32000, 2, 640, 349}, Band{44100, 2, 640, 349}),
                         nameOf);

TEST_P(OggSpeexEncoderAtRate, HeaderPacketTellsTheTrueRateAndTheBand) {
    const std::vector<OggPage> pages =
        TestSupport::readOggPages(encodeAll(makeSound(1000), GetParam().rate, 8));
    ASSERT_GE(pages.size(), 3U);
    ASSERT_THAT(pages[0].packets, SizeIs(1));
    const TestSupport::SpeexHeaderFields header = TestSupport::readSpeexHeader(pages[0].packets[0]);
    ASSERT_TRUE(header.valid);
    EXPECT_EQ(header.rate, GetParam().rate);
    EXPECT_EQ(header.mode, GetParam().mode);
    EXPECT_EQ(header.frameSize, GetParam().frame);
    EXPECT_EQ(header.channels, 1);
    EXPECT_EQ(header.framesPerPacket, 1);
    // The comment packet: the vendor's length and name, then the count of comments.
    ASSERT_THAT(pages[1].packets, SizeIs(1));
    const Bytes& comment = pages[1].packets[0];
    ASSERT_GT(comment.size(), 8U);
    EXPECT_EQ(comment[0] + 8U, comment.size());
    EXPECT_EQ(Bytes(comment.end() - 4, comment.end()), Bytes(4, 0));
}

TEST_P(OggSpeexEncoderAtRate, PagesAreWellFormedAndCountSamples) {
    for (const int length : lengths()) {
        for (const int fill : {512, 4096}) {
            SCOPED_TRACE(std::to_string(length) + " samples, fill " + std::to_string(fill));
            const Bytes stream = encodeAll(makeSound(length), GetParam().rate, 8, fill);
            const std::vector<OggPage> pages = TestSupport::readOggPages(stream);
            std::size_t total = 0;
            int64_t packetCount = 0;
            ASSERT_GE(pages.size(), 2U);
            for (std::size_t i = 0; i < pages.size(); ++i) {
                const OggPage& page = pages[i];
                const bool last = i + 1 == pages.size();
                total += page.sizeInBytes;
                EXPECT_TRUE(page.checksumRight);
                EXPECT_FALSE(page.continued);
                EXPECT_EQ(page.sequenceNumber, i);
                EXPECT_EQ(page.serialNumber, pages[0].serialNumber);
                EXPECT_EQ(page.first, i == 0);
                EXPECT_EQ(page.last, last);
                packetCount += i < 2 ? 0 : static_cast<int64_t>(page.packets.size());
                const int64_t covered = packetCount * GetParam().frame - GetParam().lookAhead;
                EXPECT_EQ(page.granulePosition, last ? length : i < 2 ? 0 : covered);
            }
            EXPECT_EQ(total, stream.size());
        }
    }
}

TEST_P(OggSpeexEncoderAtRate, SpeexdecGivesBackEverySample) {
    if (!TestSupport::ChildProcess::isInstalled("speexdec")) {
        GTEST_SKIP() << "speexdec is not installed";
    }
    const std::vector<int> qualities = {0, 4, 8, 10};
    std::size_t run = 0;
    for (const int length : lengths()) {
        for (const int fill : {512, 4096}) {
            const int quality = qualities[run++ % qualities.size()];
            SCOPED_TRACE(std::to_string(length) + " samples, quality " + std::to_string(quality) +
                         ", fill " + std::to_string(fill));
            const TestSupport::DecodedSound sound = TestSupport::decodeWithSpeexdec(
                encodeAll(makeSound(length), GetParam().rate, quality, fill));
            ASSERT_TRUE(sound.decoded) << sound.message;
            if (length == 0 || length >= exactFrom()) {
                EXPECT_EQ(sound.samples.size(), static_cast<std::size_t>(length));
            } else {
                EXPECT_GE(sound.samples.size(), static_cast<std::size_t>(length));
                EXPECT_LE(sound.samples.size(), static_cast<std::size_t>(GetParam().frame));
            }
        }
    }
}

TEST_P(OggSpeexEncoderAtRate, FfmpegDecodesTheRightLength) {
    if (!TestSupport::ChildProcess::isInstalled("ffmpeg")) {
        GTEST_SKIP() << "ffmpeg is not installed";
    }
    for (const int length : {GetParam().frame, 12345}) {
        SCOPED_TRACE(std::to_string(length) + " samples");
        const Bytes stream = encodeAll(makeSound(length), GetParam().rate, 8, 512);
        // FFmpeg gives whole packets, with time stamps that say where the sound is.
        std::size_t packetCount = 0;
        for (const OggPage& page : TestSupport::readOggPages(stream)) {
            packetCount += page.packets.size();
        }
        const TestSupport::DecodedSound whole = TestSupport::decodeWithFfmpeg(stream);
        ASSERT_TRUE(whole.decoded) << whole.message;
        EXPECT_EQ(whole.message, "");
        EXPECT_EQ(whole.samples.size(),
                  (packetCount - 2) * static_cast<std::size_t>(GetParam().frame));
        const TestSupport::DecodedSound cut = TestSupport::decodeWithFfmpeg(stream, length);
        ASSERT_TRUE(cut.decoded) << cut.message;
        EXPECT_EQ(cut.samples.size(), static_cast<std::size_t>(length));
    }
}

/** Signal to noise, as a ratio of energies, with `decoded` shifted by `shift` samples. */
double qualityAt(const Samples& original, const Samples& decoded, int shift) {
    double signal = 0;
    double noise = 1;
    for (std::size_t i = 1000; i + 1000 < original.size(); ++i) {
        const double wanted = original[i];
        const double got = decoded[i + static_cast<std::size_t>(shift)];
        signal += wanted * wanted;
        noise += (wanted - got) * (wanted - got);
    }
    return signal / noise;
}

TEST_P(OggSpeexEncoderAtRate, DecodedSoundIsTheSoundAndNotShifted) {
    if (!TestSupport::ChildProcess::isInstalled("speexdec")) {
        GTEST_SKIP() << "speexdec is not installed";
    }
    const Samples original = TestSupport::makeSpeechLike(GetParam().rate, 1000);
    const Samples decoded =
        TestSupport::decodeWithSpeexdec(encodeAll(original, GetParam().rate, 10)).samples;
    ASSERT_EQ(decoded.size(), original.size());
    int best = -1000;
    double bestQuality = 0;
    for (int shift = -40; shift <= 40; ++shift) {
        const double quality = qualityAt(original, decoded, shift);
        if (quality > bestQuality) {
            bestQuality = quality;
            best = shift;
        }
    }
    EXPECT_NEAR(best, 0, 1);
    EXPECT_GT(bestQuality, 2.0);
}

TEST(OggSpeexEncoder, SpeexdecGivesBackEverySampleWhateverRemainsOfTheLastFrame) {
    if (!TestSupport::ChildProcess::isInstalled("speexdec")) {
        GTEST_SKIP() << "speexdec is not installed";
    }
    for (const Band& band :
         {Band{8000, 0, 160, 40}, Band{16000, 1, 320, 143}, Band{32000, 2, 640, 349}}) {
        for (int remainder = 0; remainder < band.frame; remainder += band.frame / 16 - 1) {
            const int length = 20 * band.frame + remainder;
            const TestSupport::DecodedSound sound =
                TestSupport::decodeWithSpeexdec(encodeAll(makeSound(length), band.rate, 8, 512));
            EXPECT_EQ(sound.samples.size(), static_cast<std::size_t>(length)) << sound.message;
        }
    }
}

TEST(OggSpeexEncoder, PagesAreClosedAtTheirFill) {
    const Samples sound = makeSound(160000);
    for (const int fill : {512, 4096}) {
        const std::vector<OggPage> pages =
            TestSupport::readOggPages(encodeAll(sound, 16000, 8, fill));
        ASSERT_GT(pages.size(), 4U);
        for (std::size_t i = 2; i + 2 < pages.size(); ++i) {
            const OggPage& page = pages[i];
            std::size_t body = 0;
            for (const Bytes& packet : page.packets) {
                body += packet.size();
            }
            EXPECT_GT(body, static_cast<std::size_t>(fill));
            EXPECT_LE(body - page.packets.back().size(), static_cast<std::size_t>(fill));
            EXPECT_LT(page.sizeInBytes, static_cast<std::size_t>(fill) + 200);
        }
    }
}

TEST(OggSpeexEncoder, PageHoldsAtLeastFourPackets) {
    for (const int fill : {-7, 0, 1}) {
        const std::vector<OggPage> pages =
            TestSupport::readOggPages(encodeAll(makeSound(16000), 16000, 8, fill));
        ASSERT_GT(pages.size(), 6U);
        for (std::size_t i = 2; i + 2 < pages.size(); ++i) {
            EXPECT_THAT(pages[i].packets, SizeIs(4));
        }
    }
}

TEST(OggSpeexEncoder, LargeFillStillMakesLegalPages) {
    const std::vector<OggPage> pages =
        TestSupport::readOggPages(encodeAll(makeSound(400000), 16000, 8, INT_MAX));
    ASSERT_GT(pages.size(), 4U);
    for (const OggPage& page : pages) {
        EXPECT_TRUE(page.checksumRight);
        EXPECT_LE(page.packets.size(), 255U);
    }
    EXPECT_EQ(pages.back().granulePosition, 400000);
}

TEST(OggSpeexEncoder, SmallPagesLeaveWhileSoundComesIn) {
    OggSpeexEncoder encoder(formatOf(16000), 8, 512);
    Bytes stream;
    int64_t encoded = 0;
    for (const SoundDataBuffer& buffer :
         TestSupport::cutIntoBuffers(TestSupport::makeSpeechLike(16000, 2000), 16000)) {
        encoder.encode(buffer);
        encoded += buffer.getSampleCount();
        const Bytes piece = takeAll(encoder);
        stream.insert(stream.end(), piece.begin(), piece.end());
        const std::vector<OggPage> pages = TestSupport::readOggPages(stream);
        ASSERT_GE(pages.size(), 2U);
        // A page of 512 bytes holds 160 ms at this quality; the look-ahead comes on top.
        EXPECT_LT(encoded - pages.back().granulePosition, 16000 * 2 / 10);
    }
    encoder.finish();
    const Bytes rest = takeAll(encoder);
    stream.insert(stream.end(), rest.begin(), rest.end());
    EXPECT_EQ(TestSupport::readOggPages(stream).back().granulePosition, encoded);
}

TEST(OggSpeexEncoder, StreamDoesNotDependOnHowTheSoundIsCut) {
    const Samples sound = makeSound(12345);
    const Bytes expected = encodeAll(sound, 16000, 8);
    for (const std::size_t length : {1U, 7U, 319U, 320U, 1600U}) {
        OggSpeexEncoder encoder(formatOf(16000), 8);
        for (std::size_t begin = 0; begin < sound.size(); begin += length) {
            const std::size_t count = std::min(length, sound.size() - begin);
            encoder.encode(
                SoundDataBuffer(formatOf(16000), TestSupport::toBytes(sound, begin, count)));
        }
        encoder.finish();
        EXPECT_EQ(takeAll(encoder), expected) << length;
    }
}

TEST(OggSpeexEncoder, OutputCanBeTakenInParts) {
    const Samples sound = makeSound(12345);
    const Bytes expected = encodeAll(sound, 16000, 8);
    OggSpeexEncoder encoder(formatOf(16000), 8);
    encoder.encode(TestSupport::makeBuffer(sound, 16000));
    encoder.finish();
    EXPECT_TRUE(encoder.takeOutput(0)->getData().empty());
    Bytes stream;
    for (Bytes part = encoder.takeOutput(1000)->getData(); !part.empty();
         part = encoder.takeOutput(1000)->getData()) {
        EXPECT_EQ(part.size(), std::min<std::size_t>(1000, expected.size() - stream.size()));
        stream.insert(stream.end(), part.begin(), part.end());
    }
    EXPECT_EQ(stream, expected);
}

TEST(OggSpeexEncoder, OutputSaysThatItIsSpeex) {
    OggSpeexEncoder encoder(formatOf(8000), 8);
    encoder.finish();
    const boost::shared_ptr<SoundDataBuffer> output = encoder.takeOutput(-1);
    ASSERT_TRUE(output);
    EXPECT_EQ(output->getInfo().getCodec(), SoundDataInfo::SPEEX);
    EXPECT_EQ(output->getInfo().getChannelCount(), 1);
    EXPECT_EQ(output->getInfo().getSampleRate(), 8000);
    EXPECT_EQ(output->getInfo().getSampleSize(), 2);
    EXPECT_EQ(output->getInfo().getSampleCount(), -1);
}

TEST(OggSpeexEncoder, OutputIsNullBeforeTheFirstFrameAndEmptyWhenAllWasTaken) {
    OggSpeexEncoder encoder(formatOf(16000), 8);
    EXPECT_FALSE(encoder.takeOutput(-1));
    encoder.encode(TestSupport::makeBuffer(makeSound(319), 16000));
    EXPECT_FALSE(encoder.takeOutput(-1));
    encoder.encode(TestSupport::makeBuffer(makeSound(1), 16000));
    EXPECT_EQ(TestSupport::readOggPages(takeAll(encoder)).size(), 2U);
    ASSERT_TRUE(encoder.takeOutput(-1));
    EXPECT_TRUE(encoder.takeOutput(-1)->getData().empty());
}

TEST(OggSpeexEncoder, FinishWithoutSoundLeavesTheHeadersAlone) {
    OggSpeexEncoder encoder(formatOf(16000), 8);
    encoder.encode(SoundDataBuffer(formatOf(16000)));
    encoder.finish();
    const std::vector<OggPage> pages = TestSupport::readOggPages(takeAll(encoder));
    ASSERT_EQ(pages.size(), 2U);
    EXPECT_THAT(pages[0].packets, SizeIs(1));
    EXPECT_THAT(pages[1].packets, SizeIs(1));
    EXPECT_TRUE(pages[1].last);
    EXPECT_EQ(pages[1].granulePosition, 0);
}

TEST(OggSpeexEncoder, SoundAfterTheEndIsIgnoredWithALogLine) {
    const TestSupport::LogCapture log;
    OggSpeexEncoder encoder(formatOf(16000), 8);
    encoder.encode(TestSupport::makeBuffer(makeSound(500), 16000));
    encoder.finish();
    EXPECT_FALSE(takeAll(encoder).empty());
    encoder.encode(TestSupport::makeBuffer(makeSound(500), 16000));
    encoder.finish();
    EXPECT_TRUE(takeAll(encoder).empty());
    EXPECT_EQ(log.count("OggSpeexEncoder: sound after the end is ignored"), 1U);
}

TEST(OggSpeexEncoder, QualityIsTakenToTheNearerEnd) {
    const Samples sound = makeSound(16000);
    EXPECT_EQ(encodeAll(sound, 16000, -5), encodeAll(sound, 16000, 0));
    EXPECT_EQ(encodeAll(sound, 16000, INT_MIN), encodeAll(sound, 16000, 0));
    EXPECT_EQ(encodeAll(sound, 16000, 11), encodeAll(sound, 16000, 10));
    EXPECT_EQ(encodeAll(sound, 16000, INT_MAX), encodeAll(sound, 16000, 10));
    std::size_t before = 0;
    for (int quality = 0; quality <= 10; ++quality) {
        const std::size_t size = encodeAll(sound, 16000, quality).size();
        EXPECT_GT(size, before) << quality;
        before = size;
    }
}

TEST(OggSpeexEncoder, FormatThatCannotBeEncodedYieldsNothingAndALogLine) {
    const SoundDataInfo formats[] = {
        SoundDataInfo(),
        SoundDataInfo(SoundDataInfo::SPEEX, 1, 16000, 2),
        SoundDataInfo(SoundDataInfo::NONE, 2, 16000, 2),
        SoundDataInfo(SoundDataInfo::NONE, 0, 16000, 2),
        SoundDataInfo(SoundDataInfo::NONE, 1, 16000, 1),
        SoundDataInfo(SoundDataInfo::NONE, 1, 0, 2),
        SoundDataInfo(SoundDataInfo::NONE, 1, -8000, 2),
        SoundDataInfo(SoundDataInfo::NONE, 1, INT_MIN, 2),
    };
    for (const SoundDataInfo& format : formats) {
        const TestSupport::LogCapture log;
        OggSpeexEncoder encoder(format, 8);
        EXPECT_EQ(log.messages().size(), 1U);
        EXPECT_TRUE(log.containsPart("OggSpeexEncoder: cannot encode this format: codec "));
        encoder.encode(SoundDataBuffer(format, Bytes(6400, 1)));
        EXPECT_FALSE(encoder.takeOutput(-1));
        encoder.finish();
        ASSERT_TRUE(encoder.takeOutput(-1));
        EXPECT_TRUE(takeAll(encoder).empty());
    }
}

TEST(OggSpeexEncoder, UnusualRatesAreEncoded) {
    for (const int rate : {1, 100, 4000, 96000, 384000, INT_MAX}) {
        const std::vector<OggPage> pages =
            TestSupport::readOggPages(encodeAll(makeSound(5000), rate, 8));
        ASSERT_GE(pages.size(), 3U) << rate;
        EXPECT_EQ(TestSupport::readSpeexHeader(pages[0].packets[0]).rate, rate);
        EXPECT_EQ(pages.back().granulePosition, 5000);
    }
}

TEST(OggSpeexEncoder, BufferOfAnotherFormatIsIgnoredWithALogLine) {
    const TestSupport::LogCapture log;
    OggSpeexEncoder encoder(formatOf(16000), 8);
    const SoundDataInfo stereo(SoundDataInfo::NONE, 2, 16000, 2);
    encoder.encode(SoundDataBuffer(stereo, Bytes(6400, 1)));
    encoder.encode(TestSupport::makeBuffer(makeSound(1600), 8000));
    EXPECT_EQ(log.messages(),
              (std::vector<std::string>{"OggSpeexEncoder: sound of another format is ignored: "
                                        "codec 0, 2 channels, 16000 Hz, 2 bytes a sample",
                                        "OggSpeexEncoder: sound of another format is ignored: "
                                        "codec 0, 1 channels, 8000 Hz, 2 bytes a sample"}));
    encoder.encode(TestSupport::makeBuffer(makeSound(1600), 16000));
    encoder.finish();
    EXPECT_EQ(TestSupport::readOggPages(takeAll(encoder)).back().granulePosition, 1600);
}

TEST(OggSpeexEncoder, BufferCountsAtItsBytesWhateverItClaims) {
    for (const int claimed : {-1, 0, 3, 1600, INT_MAX}) {
        OggSpeexEncoder encoder(formatOf(16000), 8);
        const SoundDataInfo info(SoundDataInfo::NONE, 1, 16000, 2, claimed);
        encoder.encode(SoundDataBuffer(info, Bytes(2001, 1)));
        encoder.finish();
        EXPECT_EQ(TestSupport::readOggPages(takeAll(encoder)).back().granulePosition, 1000)
            << claimed;
    }
}

TEST(OggSpeexEncoder, LoudestSoundIsEncoded) {
    Samples sound(16000, INT16_MIN);
    std::fill(sound.begin(), sound.begin() + 8000, INT16_MAX);
    for (const int rate : {8000, 16000, 32000}) {
        const std::vector<OggPage> pages = TestSupport::readOggPages(encodeAll(sound, rate, 10));
        EXPECT_EQ(pages.back().granulePosition, 16000);
    }
}

}  // namespace
