#include "gateway/SpeexStreamDecoder.h"

#include <gtest/gtest.h>
#include <speex/speex_header.h>

#include <cstring>

#include "gateway/RecordedSpeech.h"
#include "support/OggSpeexDecoder.h"

namespace {

using Gateway::SpeexStreamDecoder;
using Samples = std::vector<int16_t>;

struct Decoded {
    Samples samples;
    unsigned rateHz = 0;
    unsigned damaged = 0;
    std::string reason;
};

Decoded decode(const std::string& stream, std::size_t piece = 1000000) {
    Decoded decoded;
    SpeexStreamDecoder decoder;
    for (std::size_t i = 0; i < stream.size() && decoded.reason.empty(); i += piece) {
        decoded.reason = decoder.write(reinterpret_cast<const unsigned char*>(stream.data()) + i,
                                       std::min(piece, stream.size() - i), decoded.samples);
    }
    decoded.rateHz = decoder.getRateHz();
    decoded.damaged = decoder.getDamagedPackets();
    return decoded;
}

const Samples& speech() {
    static const Samples samples = GatewayTest::readRecording("goforward.raw");
    return samples;
}

const std::string& wideStream() {
    static const std::string stream = GatewayTest::encodeWithSpeexenc(speech(), 16000, "wideband");
    return stream;
}

/** A Speex head of which the test spoils a field, alone on its page. */
std::string headPage(void (*spoil)(SpeexHeader&)) {
    SpeexHeader header;
    speex_init_header(&header, 16000, 1, speex_lib_get_mode(SPEEX_MODEID_WB));
    spoil(header);
    int size = 0;
    char* bytes = speex_header_to_packet(&header, &size);
    ogg_stream_state stream;
    ogg_stream_init(&stream, 7);
    ogg_packet packet{};
    packet.packet = reinterpret_cast<unsigned char*>(bytes);
    packet.bytes = size;
    packet.b_o_s = 1;
    ogg_stream_packetin(&stream, &packet);
    speex_header_free(bytes);
    ogg_page page;
    EXPECT_NE(0, ogg_stream_flush(&stream, &page));
    std::string text(reinterpret_cast<char*>(page.header),
                     static_cast<std::size_t>(page.header_len));
    text.append(reinterpret_cast<char*>(page.body), static_cast<std::size_t>(page.body_len));
    ogg_stream_clear(&stream);
    return text;
}

/** Pages with a right check sum around packets that no encoder made. */
std::string noisePages(int count) {
    std::string stream;
    ogg_stream_state state;
    ogg_stream_init(&state, 7);
    state.pageno = 1;
    uint32_t random = 5;
    for (int i = 0; i < count; ++i) {
        std::vector<unsigned char> noise(static_cast<std::size_t>(1 + i % 100));
        for (unsigned char& byte : noise) {
            random = random * 1664525U + 1013904223U;
            byte = static_cast<unsigned char>(random >> 16U);
        }
        ogg_packet packet{};
        packet.packet = noise.data();
        packet.bytes = static_cast<long>(noise.size());
        packet.packetno = i + 1;
        ogg_stream_packetin(&state, &packet);
        ogg_page page;
        while (ogg_stream_flush(&state, &page) != 0) {
            stream.append(reinterpret_cast<char*>(page.header),
                          static_cast<std::size_t>(page.header_len));
            stream.append(reinterpret_cast<char*>(page.body),
                          static_cast<std::size_t>(page.body_len));
        }
    }
    ogg_stream_clear(&state);
    return stream;
}

}  // namespace

TEST(SpeexStreamDecoder, GivesWhatSpeexdecGives) {
    for (const auto& form : std::vector<std::pair<std::string, int>>{
             {"narrowband", 8000}, {"wideband", 16000}, {"ultra-wideband", 32000}}) {
        const std::string stream =
            GatewayTest::encodeWithSpeexenc(speech(), form.second, form.first);
        const Decoded decoded = decode(stream);
        EXPECT_EQ("", decoded.reason);
        EXPECT_EQ(static_cast<unsigned>(form.second), decoded.rateHz);
        EXPECT_EQ(0U, decoded.damaged);
        const TestSupport::DecodedSound expected =
            TestSupport::decodeWithSpeexdec(TestSupport::Bytes(stream.begin(), stream.end()));
        ASSERT_TRUE(expected.decoded) << expected.message;
        EXPECT_EQ(expected.samples, decoded.samples) << form.first;
    }
}

TEST(SpeexStreamDecoder, GivesTheSameFromPiecesOfAnySize) {
    const Decoded whole = decode(wideStream());
    for (const std::size_t piece : {1U, 3U, 27U, 512U, 4095U, 4097U}) {
        EXPECT_EQ(whole.samples, decode(wideStream(), piece).samples) << piece;
    }
}

TEST(SpeexStreamDecoder, DecodesEachPageWhenItIsComplete) {
    const TestSupport::Bytes bytes(wideStream().begin(), wideStream().end());
    const std::vector<TestSupport::OggPage> pages = TestSupport::readOggPages(bytes);
    ASSERT_GT(pages.size(), 3U);
    SpeexStreamDecoder decoder;
    std::size_t offset = 0;
    std::size_t before = 0;
    Samples samples;
    for (std::size_t i = 0; i < pages.size(); ++i) {
        EXPECT_EQ("", decoder.write(bytes.data() + offset, pages[i].sizeInBytes, samples));
        offset += pages[i].sizeInBytes;
        EXPECT_EQ(i >= 2, samples.size() > before) << "page " << i;
        before = samples.size();
    }
}

TEST(SpeexStreamDecoder, RefusesWhatIsNoOggStream) {
    EXPECT_EQ("the sound is not an Ogg stream", decode(GatewayTest::toPcm(speech())).reason);
    EXPECT_EQ("the sound is not an Ogg stream", decode(std::string(100, '\0')).reason);
}

TEST(SpeexStreamDecoder, RefusesHeadsThatCannotBe) {
    EXPECT_EQ("", decode(headPage([](SpeexHeader&) {})).reason);
    const std::string notSpeex = "the Ogg stream does not begin with a Speex header";
    EXPECT_EQ(notSpeex, decode(headPage([](SpeexHeader& header) {
                            std::memcpy(header.speex_string, "Vorbis  ", 8);
                        })).reason);
    const std::string impossible =
        "the Speex header has a mode, rate or packet size that cannot be";
    for (void (*spoil)(SpeexHeader&) :
         {+[](SpeexHeader& header) { header.rate = 0; },
          +[](SpeexHeader& header) { header.rate = 2000000000; },
          +[](SpeexHeader& header) { header.frames_per_packet = 2000000000; },
          +[](SpeexHeader& header) { header.frames_per_packet = -1; },
          +[](SpeexHeader& header) { header.extra_headers = -1; },
          +[](SpeexHeader& header) { header.extra_headers = 1000; }}) {
        EXPECT_EQ(impossible, decode(headPage(spoil)).reason);
    }
    EXPECT_NE("", decode(headPage([](SpeexHeader& header) { header.mode = 77; })).reason);
    EXPECT_NE("", decode(headPage([](SpeexHeader& header) { header.mode = -1; })).reason);
}

TEST(SpeexStreamDecoder, LosesOnlyThePageThatIsDamaged) {
    const TestSupport::Bytes bytes(wideStream().begin(), wideStream().end());
    const std::vector<TestSupport::OggPage> pages = TestSupport::readOggPages(bytes);
    const std::size_t begin = pages[0].sizeInBytes + pages[1].sizeInBytes;
    std::string damaged = wideStream();
    damaged[begin + pages[2].sizeInBytes / 2] ^= 0x55;
    const Decoded decoded = decode(damaged);
    EXPECT_EQ("", decoded.reason);
    EXPECT_GT(decoded.damaged, 0U);
    const std::size_t whole = decode(wideStream()).samples.size();
    EXPECT_LT(decoded.samples.size(), whole);
    EXPECT_GE(decoded.samples.size() + (pages[2].packets.size() + 1) * 320, whole);
}

TEST(SpeexStreamDecoder, SkipsBytesBetweenPages) {
    const TestSupport::Bytes bytes(wideStream().begin(), wideStream().end());
    const std::vector<TestSupport::OggPage> pages = TestSupport::readOggPages(bytes);
    std::string mixed = wideStream();
    mixed.insert(pages[0].sizeInBytes + pages[1].sizeInBytes, "OggS, or rather not");
    EXPECT_EQ(decode(wideStream()).samples, decode(mixed).samples);
}

TEST(SpeexStreamDecoder, SurvivesDamageAnywhere) {
    uint32_t state = 1;
    for (int round = 0; round < 200; ++round) {
        std::string damaged = wideStream();
        for (int i = 0; i < 1 + round % 20; ++i) {
            state = state * 1664525U + 1013904223U;
            damaged[(state >> 8U) % damaged.size()] = static_cast<char>(state >> 3U);
        }
        const Decoded decoded = decode(damaged, 1 + static_cast<std::size_t>(round) * 13);
        EXPECT_LE(decoded.samples.size(), speech().size() + 640) << round;
    }
}

TEST(SpeexStreamDecoder, SurvivesPacketsOfNoise) {
    const std::string stream =
        headPage([](SpeexHeader& header) { header.frames_per_packet = 16; }) + noisePages(300);
    const Decoded decoded = decode(stream);
    EXPECT_EQ("", decoded.reason);
    EXPECT_GT(decoded.damaged, 0U);
    EXPECT_LE(decoded.samples.size(), 300U * 16 * 320);
}

TEST(SpeexStreamDecoder, MakesTheSameOfTheSameDamage) {
    const std::string stream = headPage([](SpeexHeader& header) {
                                   header.mode = SPEEX_MODEID_UWB;
                                   header.rate = 32000;
                                   header.frames_per_packet = 4;
                               }) +
                               noisePages(300);
    const Decoded first = decode(stream);
    EXPECT_GT(first.damaged, 0U);
    EXPECT_FALSE(first.samples.empty());
    // What another stream has left behind in memory must not be heard.
    EXPECT_FALSE(decode(wideStream()).samples.empty());
    EXPECT_EQ(first.samples, decode(stream).samples);
    EXPECT_EQ(first.samples, decode(stream, 1).samples);
}
