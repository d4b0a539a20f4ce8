#include "talvox/impl/RequestFormat.h"

#include <gtest/gtest.h>

#include "support/AssertCapture.h"
#include "support/CommaLocale.h"

namespace {

using Talvox::Settings;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::CommaLocale;

const char* const SOURCE = "talvox/impl/RecognizeRequest";

Settings makeEngineSettings(const std::string& url) {
    Settings settings;
    settings.putString(Settings::SKS_URL, url);
    settings.putString(Settings::SKS_UUID, "id");
    return settings;
}

Sound::SoundDataInfo makePcm(int sampleRate) {
    return {Sound::SoundDataInfo::NONE, 1, sampleRate, 2};
}

TEST(ContentType, NamesTheRateOfPcm) {
    EXPECT_EQ(Talvox::makeContentType(makePcm(16000)), "audio/x-pcm;bit=16;rate=16000");
    EXPECT_EQ(Talvox::makeContentType(makePcm(-7)), "audio/x-pcm;bit=16;rate=-7");
}

TEST(ContentType, SaysNothingMoreOfSpeex) {
    EXPECT_EQ(Talvox::makeContentType({Sound::SoundDataInfo::SPEEX, 2, 1, 1}), "audio/x-speex");
}

TEST(ContentType, AssertsWhatTheServiceDoesNotKnow) {
    const AssertCapture asserts;
    Talvox::makeContentType({static_cast<Sound::SoundDataInfo::Codec>(1), 2, 16000, 1});
    EXPECT_EQ(
        asserts.reports(),
        (std::vector<AssertReport>{{"aInfo.getCodec() == Sound::SoundDataInfo::NONE", SOURCE, 317},
                                   {"aInfo.getChannelCount() == 1", SOURCE, 318},
                                   {"aInfo.getSampleSize() == 2", SOURCE, 319}}));
}

TEST(RequestUrl, IsTheSameWithAndWithoutThePathInTheSetting) {
    const Settings recognizer;
    const std::string expected = "http://host/asrgw?uuid=id";
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("http://host"), recognizer, false, "t"),
              expected);
    EXPECT_EQ(
        Talvox::makeRequestUrl(makeEngineSettings("http://host/asrgw"), recognizer, false, "t"),
        expected);
}

TEST(RequestUrl, LosesOnlyOnePath) {
    EXPECT_EQ(
        Talvox::makeRequestUrl(makeEngineSettings("http://h/asrgw/asrgw"), Settings(), false, "t"),
        "http://h/asrgw/asrgw?uuid=id");
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("/asrgw"), Settings(), false, "t"),
              "/asrgw?uuid=id");
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("srgw"), Settings(), false, "t"),
              "srgw/asrgw?uuid=id");
}

TEST(RequestUrl, OfAStreamCarriesActionAndContentTypeAsTheyAre) {
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("http://host/asrgw"), Settings(), true,
                                     "audio/x-pcm;bit=16;rate=16000"),
              "http://host/asrgw_chunked?uuid=id&action=verbose&Content-Type="
              "audio/x-pcm;bit=16;rate=16000");
}

TEST(RequestUrl, CarriesASessionIdentifierUnlessEmpty) {
    Settings recognizer;
    recognizer.putString(Settings::RS_SESSION_ID, "a b&c");
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("http://h"), recognizer, false, "t"),
              "http://h/asrgw?uuid=id&sessionId=a b&c");
    EXPECT_EQ(Talvox::makeRequestUrl(makeEngineSettings("http://h"), recognizer, true, "t"),
              "http://h/asrgw_chunked?uuid=id&action=verbose&Content-Type=t&sessionId=a b&c");
}

TEST(RequestUrl, OfAStreamAssertsTheIdentifierAndGoesOn) {
    Settings engine = makeEngineSettings("http://h");
    engine.putString(Settings::SKS_UUID, "");
    const AssertCapture asserts;
    EXPECT_EQ(Talvox::makeRequestUrl(engine, Settings(), true, "t"),
              "http://h/asrgw_chunked?uuid=&action=verbose&Content-Type=t");
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"!talvoxSettings.getUuid().empty()", SOURCE, 137}}));
}

TEST(Location, HasSixDecimalsEach) {
    EXPECT_EQ(Talvox::formatLocation({0.0F, 0.0F}), "0.000000,0.000000");
    EXPECT_EQ(Talvox::formatLocation({55.75F, -37.5F}), "55.750000,-37.500000");
    EXPECT_EQ(Talvox::formatLocation({1e10F, 0.5F}), "10000000000.000000,0.500000");
}

TEST(Location, HasPointsWhateverTheLocale) {
    if (!CommaLocale::isAvailable()) {
        GTEST_SKIP() << "no locale with a decimal comma can be made on this machine";
    }
    const CommaLocale comma;
    ASSERT_TRUE(comma.isSet());
    EXPECT_EQ(Talvox::formatLocation({1.5F, 2.5F}), "1.500000,2.500000");
}

TEST(Transcripts, AreWrittenLineByLine) {
    const Talvox::RecognitionResults results = {{"one", 0.85F}, {"two & <three>", 0.0F}};
    EXPECT_EQ(Talvox::makeTranscripts(results, {"android", "ru-RU", "maps"}),
              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
              "<Transcripts source=\"android\" default_language=\"ru-RU\" topic=\"maps\">\n"
              "  <Transcript confidence=\"0.85\">one</Transcript>\n"
              "  <Transcript confidence=\"0\">two & <three></Transcript>\n"
              "</Transcripts>\n");
}

TEST(Transcripts, LeaveOutWhatIsEmpty) {
    EXPECT_EQ(Talvox::makeTranscripts({}, {"", "", ""}),
              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
              "<Transcripts source=\"\">\n"
              "</Transcripts>\n");
}

TEST(Transcripts, LeaveOutAnUnknownConfidence) {
    EXPECT_EQ(Talvox::makeTranscripts({{"x", -1.0F}}, {"s", "", ""}),
              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
              "<Transcripts source=\"s\">\n"
              "  <Transcript>x</Transcript>\n"
              "</Transcripts>\n");
}

TEST(Transcripts, PrintConfidencesWithSixDigits) {
    EXPECT_NE(Talvox::makeTranscripts({{"x", 0.123456789F}}, {}).find("confidence=\"0.123457\""),
              std::string::npos);
}

}  // namespace
