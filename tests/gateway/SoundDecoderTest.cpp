#include "gateway/SoundDecoder.h"

#include <gtest/gtest.h>

#include <cmath>

#include "gateway/RecordedSpeech.h"

namespace {

using Gateway::AudioFormat;
using Gateway::SoundDecoder;
using Samples = std::vector<int16_t>;

Samples sine(double hertz, unsigned rateHz, std::size_t count) {
    Samples samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        samples[i] = static_cast<int16_t>(
            10000 * std::sin(2 * 3.14159265358979 * hertz * static_cast<double>(i) / rateHz));
    }
    return samples;
}

Samples decodePcm(const std::string& bytes, unsigned rateHz, std::size_t piece,
                  std::string* remark = nullptr) {
    AudioFormat format;
    format.rateHz = rateHz;
    SoundDecoder decoder(format, 16000);
    Samples output;
    for (std::size_t i = 0; i < bytes.size(); i += piece) {
        EXPECT_EQ("", decoder.write(bytes.data() + i, std::min(piece, bytes.size() - i), output));
    }
    EXPECT_EQ("", decoder.finish(output));
    if (remark != nullptr) {
        *remark = decoder.getRemark();
    }
    return output;
}

}  // namespace

TEST(SoundDecoder, ReadsPcmFromPiecesOfAnySize) {
    const Samples input = GatewayTest::readRecording("goforward.raw");
    const std::string bytes = GatewayTest::toPcm(input);
    for (const std::size_t piece : {1U, 3U, 3200U, 1000000U}) {
        EXPECT_EQ(input, decodePcm(bytes, 16000, piece)) << piece;
    }
}

TEST(SoundDecoder, IgnoresHalfASampleAndSaysSo) {
    std::string remark;
    EXPECT_EQ((Samples{0x0201}), decodePcm("\x01\x02\x03", 16000, 1, &remark));
    EXPECT_EQ("half a sample at the end", remark);
    EXPECT_EQ((Samples{-2}), decodePcm("\xfe\xff", 16000, 2, &remark));
    EXPECT_EQ("", remark);
}

TEST(SoundDecoder, DoublesTheRateOfTelephoneSound) {
    const Samples output = decodePcm(GatewayTest::toPcm(sine(440, 8000, 8000)), 8000, 333);
    EXPECT_NEAR(16000.0, static_cast<double>(output.size()), 1.0);
}

TEST(SoundDecoder, ResamplesSpeexByTheRateOfItsHead) {
    const std::string stream =
        GatewayTest::encodeWithSpeexenc(sine(440, 8000, 8000), 8000, "narrowband");
    AudioFormat format;
    format.codec = AudioFormat::Codec::SPEEX;
    SoundDecoder decoder(format, 16000);
    EXPECT_EQ(0U, decoder.getInputRateHz());
    Samples output;
    EXPECT_EQ("", decoder.write(stream.data(), stream.size(), output));
    EXPECT_EQ("", decoder.finish(output));
    EXPECT_EQ(8000U, decoder.getInputRateHz());
    EXPECT_NEAR(16000.0, static_cast<double>(output.size()), 1.0);
}

TEST(SoundDecoder, MissesTheHeadOfASpeexStreamThatBreaksOff) {
    AudioFormat format;
    format.codec = AudioFormat::Codec::SPEEX;
    Samples output;
    SoundDecoder decoder(format, 16000);
    EXPECT_EQ("", decoder.write("OggS", 4, output));
    EXPECT_EQ("the sound holds no Speex header", decoder.finish(output));
    SoundDecoder silent(format, 16000);
    EXPECT_EQ("", silent.finish(output));
    EXPECT_TRUE(output.empty());
}

TEST(SoundDecoder, TakesAnOggStreamForSpeexWhateverItsTypeSays) {
    const std::string stream =
        GatewayTest::encodeWithSpeexenc(sine(440, 16000, 16000), 16000, "wideband");
    AudioFormat speex;
    speex.codec = AudioFormat::Codec::SPEEX;
    SoundDecoder announced(speex, 16000);
    Samples expected;
    EXPECT_EQ("", announced.write(stream.data(), stream.size(), expected));
    EXPECT_EQ("", announced.finish(expected));

    EXPECT_EQ(expected, decodePcm(stream, 16000, 1));
    EXPECT_EQ(expected, decodePcm(stream, 16000, 1000));
}

TEST(SoundDecoder, KeepsPcmThatOnlyBeginsLikeAnOggStream) {
    EXPECT_EQ((Samples{0x674F}), decodePcm("Og", 16000, 1));
    EXPECT_EQ((Samples{0x674F, 0x5067}), decodePcm("OggP", 16000, 1));
}
