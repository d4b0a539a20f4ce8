#include "gateway/HeaderValue.h"

#include <gtest/gtest.h>

#include "gateway/AudioFormat.h"
#include "gateway/LogText.h"

using Gateway::AudioFormat;
using Gateway::HeaderValue;

TEST(HeaderValue, TakesValueAndParametersApart) {
    HeaderValue header;
    ASSERT_TRUE(HeaderValue::parse(" Form-Data ; Name=\"a;b=\\\"c\" ;x = y z;", header));
    EXPECT_EQ("form-data", header.value);
    ASSERT_NE(nullptr, header.find("name"));
    EXPECT_EQ("a;b=\"c", *header.find("name"));
    ASSERT_NE(nullptr, header.find("x"));
    EXPECT_EQ("y z", *header.find("x"));
    EXPECT_EQ(nullptr, header.find("y"));
}

TEST(HeaderValue, RefusesMalformedTexts) {
    HeaderValue header;
    for (const char* text : {"", "  ", ";a=b", "v;a", "v;=b", "v;a=\"b", "v;a=\"b\"c", "v;a;b=c"}) {
        EXPECT_FALSE(HeaderValue::parse(text, header)) << text;
    }
}

TEST(AudioFormat, KnowsWhatClientsSend) {
    AudioFormat format;
    EXPECT_EQ("", AudioFormat::parse("audio/x-pcm;bit=16;rate=16000", format));
    EXPECT_EQ(AudioFormat::Codec::PCM16, format.codec);
    EXPECT_EQ(16000U, format.rateHz);
    EXPECT_EQ("", AudioFormat::parse("Audio/X-PCM; rate=8000; bit=16", format));
    EXPECT_EQ(8000U, format.rateHz);
    EXPECT_EQ("", AudioFormat::parse("audio/x-speex", format));
    EXPECT_EQ(AudioFormat::Codec::SPEEX, format.codec);
}

TEST(AudioFormat, RefusesTheRest) {
    AudioFormat format;
    for (const char* type :
         {"", "audio/x-pcm", "audio/x-pcm;bit=16", "audio/x-pcm;rate=16000",
          "audio/x-pcm;bit=8;rate=16000", "audio/x-pcm;bit=16;rate=", "audio/x-pcm;bit=16;rate=0",
          "audio/x-pcm;bit=16;rate=3999", "audio/x-pcm;bit=16;rate=96001",
          "audio/x-pcm;bit=16;rate=-8000", "audio/x-pcm;bit=16;rate=99999999999999999999",
          "audio/x-pcm;bit=16;rate=8000x", "audio/wav", "text/plain"}) {
        EXPECT_NE("", AudioFormat::parse(type, format)) << type;
    }
}

TEST(LogText, ShowsAClientsTextInOneHarmlessLine) {
    using Gateway::toLogText;
    EXPECT_EQ("-", toLogText(""));
    EXPECT_EQ("plain", toLogText("plain"));
    EXPECT_EQ("\"two words\"", toLogText("two words"));
    EXPECT_EQ("a\\x0d\\x0ab\\x1b\\xff\\x22\\x5c", toLogText("a\r\nb\x1b\xff\"\\"));
    EXPECT_EQ(std::string(300, 'x'), toLogText(std::string(300, 'x')));
    EXPECT_EQ(std::string(300, 'x') + "...", toLogText(std::string(301, 'x')));
}
