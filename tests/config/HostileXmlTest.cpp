#include <gmock/gmock.h>

#include <algorithm>
#include <cstddef>
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

const char* const NO_PATH = "updateFromXml: path /startup/features/voice does not exist";

/** Checks that a document changes nothing, and what the log says. */
void expectNothingApplied(const std::string& xml, const std::string& reason) {
    Settings settings;
    const LogCapture log;
    update(settings, xml);
    EXPECT_EQ(Settings().toXmlString("s"), settings.toXmlString("s"));
    EXPECT_THAT(log.messages(), ElementsAre(PARSE_ERROR + reason, NO_PATH));
}

/** Three settings, one to a line. */
const char* const THREE =
    "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<startup><features a=\"b\"><!-- c --><voice>\n"
    "<language>tr-TR</language>\n<Sample_Rate>8000</Sample_Rate>\n<model>maps</model>\n"
    "</voice></features></startup>\n";

/** Checks that of `THREE` those settings are applied that end before a place, and no other. */
void expectAppliedBefore(const Settings& settings, std::size_t place) {
    const std::string three = THREE;
    const auto isBefore = [&three, place](const char* end) {
        return three.find(end) + std::string(end).size() <= place;
    };
    EXPECT_EQ(isBefore("</language>") ? "tr-TR" : "ru-RU", settings.getLanguage()) << place;
    EXPECT_EQ(isBefore("</Sample_Rate>") ? 8000 : 16000, settings.getSampleRate()) << place;
    EXPECT_EQ(isBefore("</model>") ? "maps" : "general", settings.getModel()) << place;
}

/** The place of a byte of `THREE`, as the log gives it. */
std::string placeOf(std::size_t position) {
    const std::string before = std::string(THREE).substr(0, position);
    const auto lines = std::count(before.begin(), before.end(), '\n');
    const std::size_t newline = before.rfind('\n');
    const std::size_t column = newline == std::string::npos ? position + 1 : position - newline;
    return " (line " + std::to_string(lines + 1) + ", column " + std::to_string(column) + ")";
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
                ElementsAre(PARSE_ERROR + std::string("Error document empty. (line 1, column 1)"),
                            NO_PATH));
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

TEST(HostileXml, WhatIsCompleteBeforeABadByteIsApplied) {
    for (const std::string& bad :
         {std::string("\xFF"), std::string(1, '\0'), std::string("\xC3"), std::string("\xE2\x82"),
          std::string("\xC0\xAF"), std::string("\xED\xA0\x80")}) {
        for (std::size_t i = 0; i <= std::string(THREE).size(); ++i) {
            Settings settings;
            const LogCapture log;
            update(settings, std::string(THREE).insert(i, bad));
            expectAppliedBefore(settings, i);
            ASSERT_FALSE(log.messages().empty());
            EXPECT_EQ(PARSE_ERROR + ("the text is not UTF-8" + placeOf(i)), log.messages()[0]);
            EXPECT_LE(log.messages().size(), 2U);
        }
    }
}

TEST(HostileXml, ADocumentThatEndsInsideACharacterIsAppliedUpToIt) {
    Settings settings;
    const LogCapture log;
    update(settings, "<startup><features><voice><model>maps</model><url>\xD0\x96\xD0");
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_EQ("", settings.getUrl());
    EXPECT_THAT(
        log.messages(),
        ElementsAre(PARSE_ERROR + std::string("the text is not UTF-8 (line 1, column 52)")));
}

TEST(HostileXml, WhatIsCompleteBeforeABadReferenceIsApplied) {
    const struct {
        std::string reference;
        std::string reason;
    } cases[] = {{"&#x110000;", "a character reference names no character"},
                 {"&#0;", "a character reference names no character"},
                 {"&#xD800;", "a character reference names no character"},
                 {"&#;", "a character reference names no character"},
                 {"&#xZZ;", "a character reference is malformed"},
                 {"&#x41", "a character reference is malformed"},
                 {"&#", "a character reference is malformed"}};
    for (const auto& each : cases) {
        for (const char* value : {"tr-TR", "8000", "maps"}) {
            const std::size_t i = std::string(THREE).find(value) + 2;
            Settings settings;
            const LogCapture log;
            update(settings, std::string(THREE).insert(i, each.reference));
            expectAppliedBefore(settings, i);
            ASSERT_FALSE(log.messages().empty());
            EXPECT_EQ(PARSE_ERROR + (each.reason + placeOf(i)), log.messages()[0]);
        }
    }
}

TEST(HostileXml, TheFirstOfTwoErrorsCounts) {
    Settings settings;
    const LogCapture log;
    update(settings,
           "<startup><features><voice><model>maps</model></features><url>\xFF</url></voice>");
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_THAT(
        log.messages(),
        ElementsAre(PARSE_ERROR + std::string("Error reading end tag. (line 1, column 46)")));
}

TEST(HostileXml, TextBehindTheElementsIsAnError) {
    Settings settings;
    const LogCapture log;
    update(settings, document("<model>maps</model>") + "\nmore");
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_THAT(
        log.messages(),
        ElementsAre(PARSE_ERROR + std::string("text outside of the elements (line 3, column 1)")));
}

TEST(HostileXml, ADocumentInAnotherEncodingIsAppliedAsAWhole) {
    const struct {
        const char* encoding;
        const char* text;
    } cases[] = {{"ISO-8859-1", "\xC3\x84\xC2\xA4"},
                 {"windows-1251", "\xD0\x94\xC2\xA4"},
                 {"windows-1252", "\xC3\x84\xC2\xA4"},
                 {"KOI8-R", "\xC3\x84\xC2\xA4"}};
    for (const auto& each : cases) {
        Settings settings;
        update(settings, "<?xml version='1.0' encoding='" + std::string(each.encoding) +
                             "'?><startup><features><voice><url>\xC4\xA4</url>"
                             "<sessionid>\xFF</sessionid><model>maps</model></voice></features>"
                             "</startup>");
        EXPECT_EQ("maps", settings.getModel()) << each.encoding;
        EXPECT_EQ(each.text, settings.getUrl()) << each.encoding;
    }
}

TEST(HostileXml, AnUpdateFromAWholeDocumentTakesAllOrNothing) {
    const struct {
        std::string text;
        std::string fault;
    } cases[] = {
        {document("<model>maps</model>"), ""},
        {document("<model>maps</model><odd/>"), ""},
        {document("<model>maps</model><url>\xFF</url>"),
         "the text is not UTF-8 (line 2, column 51)"},
        {document("<model>maps</model>") + "more",
         "text outside of the elements (line 2, column 75)"},
        {"<startup><model>maps</model></startup>", "there is no element /startup/features/voice"},
    };
    for (const auto& each : cases) {
        Settings settings;
        EXPECT_EQ(each.fault, settings.updateFromWholeXml(each.text, Settings::XML_PATH_DFLT,
                                                          Settings::bundleSpecs));
        EXPECT_EQ(each.fault.empty() ? "maps" : "general", settings.getModel()) << each.text;
    }
}

TEST(HostileXml, DeepNestingIsRefused) {
    const std::string deep = "elements are nested too deeply (line 1, column ";
    expectNothingApplied(repeat("<a>", 100000), deep + "195)");
    expectNothingApplied(repeat("<a>", 100000) + repeat("</a>", 100000), deep + "195)");
    expectNothingApplied("<startup><features><voice><model>maps</model><url>" + repeat("<a>", 65),
                         deep + "233)");
}

TEST(HostileXml, AHugeDocumentIsRefused) {
    expectNothingApplied(
        document("<url>" + std::string(std::size_t{10} * 1024 * 1024, 'x') + "</url>"),
        "the text is too large");
    expectNothingApplied(document(repeat("<url>x</url>", 900000)), "the text is too large");
}

TEST(HostileXml, ALargeDocumentWithinTheLimitIsApplied) {
    Settings settings;
    update(settings, document(repeat("<url>x</url>", 50000) + "<url>last</url>"));
    EXPECT_EQ("last", settings.getUrl());
}

// The parser knows the five entities of XML only, and drops the "&" of any other.
TEST(HostileXml, AnUnknownEntityEndsNothingAndIsLogged) {
    Settings settings;
    const LogCapture log;
    update(settings,
           "<startup><features><voice>\n<url>a&amp;b&lt;&c=1&foo;</url><model>maps</model>"
           "</voice></features></startup>");
    EXPECT_EQ("a&b<c=1foo;", settings.getUrl());
    EXPECT_EQ("maps", settings.getModel());
    EXPECT_THAT(log.messages(),
                ElementsAre(PARSE_ERROR +
                            std::string("an unknown entity loses its \"&\" (line 2, column 17)")));
}

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

TEST(HostileXml, LimitsOfTheParserAreThoseOfTheUtility) {
    const std::string deepest = repeat("<a>", Util::XmlUtils::MAX_DEPTH);
    EXPECT_EQ("", Util::XmlUtils::findHazard(deepest));
    EXPECT_NE("", Util::XmlUtils::findHazard(deepest + "<a>"));
}
