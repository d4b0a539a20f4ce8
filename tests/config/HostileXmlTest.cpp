#include <gmock/gmock.h>

#include <string>

#include "core/util/XmlUtils.h"
#include "support/LogCapture.h"
#include "talvox/Settings.h"

using Talvox::Settings;
using ::testing::ElementsAre;
using ::testing::SizeIs;
using ::testing::StartsWith;
using TestSupport::LogCapture;

namespace {

const char* const PARSE_ERROR = "Bundle::updateFromXml parse error: ";

std::string document(const std::string& body) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<startup><features><voice>" + body +
           "</voice></features></startup>";
}

void update(Settings& settings, const std::string& xml) {
    settings.updateFromXml(xml, Settings::XML_PATH_DFLT, Settings::bundleSpecs);
}

std::string repeat(const std::string& piece, unsigned count) {
    std::string text;
    text.reserve(piece.size() * count);
    for (unsigned i = 0; i < count; ++i) {
        text += piece;
    }
    return text;
}

/** Checks that a document is turned away as a whole, with one line in the log. */
void expectRefused(const std::string& xml) {
    Settings settings;
    const LogCapture log;
    update(settings, xml);
    EXPECT_EQ(Settings().toXmlString("s"), settings.toXmlString("s"));
    EXPECT_THAT(log.messages(), ElementsAre(StartsWith(PARSE_ERROR)));
}

}  // namespace

TEST(HostileXml, WhatComesBeforeASyntaxErrorIsApplied) {
    Settings settings;
    const LogCapture log;
    update(settings, "<startup><features><voice><language>tr-TR</language><model>maps</model><asr");
    EXPECT_EQ("tr-TR", settings.getLanguage());
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_EQ("", settings.getString(Settings::SKS_ASR_POLICY_OVERRIDE));
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
    EXPECT_THAT(log.messages(), ElementsAre(StartsWith(PARSE_ERROR), "asr: no body"));
}

TEST(HostileXml, ADocumentCutAnywhereIsSurvived) {
    const std::string whole = document(
        "<!-- note --><language>tr-TR</language><model>m&amp;&#x416;</model>"
        "<myll>1.5,2.5</myll><vad attribute=\"v\"><![CDATA[<x>]]></vad><url>\xD0\x96</url>");
    for (std::size_t length = 0; length < whole.size(); ++length) {
        Settings settings;
        const LogCapture log;
        update(settings, whole.substr(0, length));
        EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs)) << length;
        EXPECT_FALSE(log.messages().empty()) << length;
    }
    Settings settings;
    update(settings, whole);
    EXPECT_EQ("\xD0\x96", settings.getUrl());
    EXPECT_EQ("<x>", settings.getString(Settings::SKS_VAD_SETTINGS));
}

TEST(HostileXml, AnEmptyDocumentIsAnError) {
    Settings settings;
    const LogCapture log;
    update(settings, "");
    EXPECT_THAT(log.messages(),
                ElementsAre(StartsWith(PARSE_ERROR),
                            "updateFromXml: path /startup/features/voice does not exist"));
}

TEST(HostileXml, WrongTypesAndNumbersBeyondRangeAreRepairedAndTheRestApplied) {
    Settings settings;
    const LogCapture log;
    update(settings, document("<samplerate>fast</samplerate><speexquality>1e99</speexquality>"
                              "<verbosity>99999999999999999999</verbosity><upperconfidence>-1e99"
                              "</upperconfidence><lowerconfidence><b>0.5</b></lowerconfidence>"
                              "<streaming><yes/></streaming><myll>north</myll><bogus>1</bogus>"
                              "<language>uk-UA</language>"));
    EXPECT_EQ("uk-UA", settings.getLanguage());
    EXPECT_EQ(1, settings.getInt(Settings::SKS_SPEEX_QUALITY));
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
    EXPECT_THAT(log.messages(), SizeIs(7));

    settings.validate();
    EXPECT_EQ(16000, settings.getSampleRate());
    EXPECT_EQ(0, settings.getInt(Settings::SKS_VERBOSE_LEVEL));
    EXPECT_EQ(0.9F, settings.getFloat(Settings::SKS_UPPER_CONFIDENCE));
    EXPECT_EQ(0.4F, settings.getFloat(Settings::SKS_LOWER_CONFIDENCE));
}

TEST(HostileXml, TextCutInsideACharacterIsRefused) {
    const std::string whole = document("<url>\xD0\x96</url>");
    const std::string cut = whole.substr(0, whole.find('\x96'));
    expectRefused(cut);
    expectRefused("<startup><features><voice><asr>\xE2\x82");
    expectRefused("<startup>\xF0");
    expectRefused("\xEF");
    expectRefused("\xEF\xBB");
}

TEST(HostileXml, BytesThatAreNoCharactersAreRefused) {
    expectRefused(document("<url>\xFF</url>"));
    expectRefused(document("<url>\xC0\xAF</url>"));
    expectRefused(document("<url>\xED\xA0\x80</url>"));
    expectRefused(document(std::string("<url>a\0b</url>", 14)));
}

TEST(HostileXml, DeepNestingIsRefused) {
    expectRefused(repeat("<a>", 100000));
    expectRefused(repeat("<a>", 100000) + repeat("</a>", 100000));
    expectRefused(document("<url>" + repeat("<a>", 65) + repeat("</a>", 65) + "</url>"));
}

TEST(HostileXml, AHugeDocumentIsRefused) {
    expectRefused(document("<url>" + std::string(10U * 1024U * 1024U, 'x') + "</url>"));
    expectRefused(document(repeat("<url>x</url>", 900000)));
}

TEST(HostileXml, ALargeDocumentWithinTheLimitIsApplied) {
    Settings settings;
    update(settings, document(repeat("<url>x</url>", 50000) + "<url>last</url>"));
    EXPECT_EQ("last", settings.getUrl());
}

// The parser knows the five entities of XML only, and drops the "&" of any other.
TEST(HostileXml, EntitiesAreNeverExpanded) {
    const std::string declarations =
        "<!DOCTYPE s [<!ENTITY a \"aaaaaaaaaa\"><!ENTITY b \"&a;&a;&a;&a;&a;&a;&a;&a;\">"
        "<!ENTITY x SYSTEM \"file:///etc/passwd\">]>";
    Settings settings;
    update(settings,
           "<startup><features><voice><url>&b;&x;</url><model>&lt;&unknown;</model>"
           "</voice></features></startup>");
    EXPECT_EQ("b;x;", settings.getUrl());
    EXPECT_EQ("<unknown;", settings.getModel());

    Settings declared;
    update(declared, declarations +
                         "<startup><features><voice><url>&x;</url></voice></features>"
                         "</startup>");
    EXPECT_EQ(Settings().toXmlString("s"), declared.toXmlString("s"));
}

TEST(HostileXml, OddCharacterReferencesAreSurvived) {
    for (const char* reference :
         {"&#0;", "&#x0;", "&#xD800;", "&#xFFFFFFFF;", "&#99999999999999999999;", "&#x;", "&#;",
          "&#x41", "&#", "&", "&#xZZ;", "&#-1;"}) {
        Settings settings;
        const LogCapture log;
        update(settings, document(std::string("<url>a") + reference + "</url><model>maps</model>"));
        EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs)) << reference;
    }
}

TEST(HostileXml, LimitsOfTheParserAreThoseOfTheUtility) {
    const std::string deepest = repeat("<a>", Util::XmlUtils::MAX_DEPTH);
    EXPECT_EQ("", Util::XmlUtils::findHazard(deepest));
    EXPECT_NE("", Util::XmlUtils::findHazard(deepest + "<a>"));
}
