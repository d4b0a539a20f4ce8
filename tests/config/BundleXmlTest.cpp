#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <cfloat>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/Settings.h"
#include "tinyxml.h"
#include "util/Bundle.h"

using Talvox::Settings;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::LogCapture;
using Util::Bundle;

namespace {

constexpr auto UNKNOWN_TYPE = static_cast<Bundle::ElemType>(42);

const Bundle::ElemSpec SUB_SPEC[] = {{"inner", Bundle::STRING, nullptr},
                                     {"count", Bundle::INT, nullptr},
                                     {nullptr, Bundle::BOOLEAN, nullptr}};
const Bundle::ElemSpec SPEC[] = {
    {"flag", Bundle::BOOLEAN, nullptr}, {"number", Bundle::INT, nullptr},
    {"ratio", Bundle::FLOAT, nullptr},  {"place", Bundle::LATLON, nullptr},
    {"text", Bundle::STRING, nullptr},  {"tree", Bundle::BUNDLE, SUB_SPEC},
    {"odd", UNKNOWN_TYPE, nullptr},     {"Spelled_Odd", Bundle::INT, nullptr},
    {nullptr, Bundle::BOOLEAN, nullptr}};

std::string element(const std::string& name, const std::string& content) {
    return "<" + name + ">" + content + "</" + name + ">";
}

/** What one element named `name` with the given text leaves in a bundle. */
Bundle updatedWith(const std::string& name, const std::string& text) {
    Bundle bundle;
    bundle.updateFromXml(element("r", element(name, text)), "r", SPEC);
    return bundle;
}

bool flagOf(const std::string& text) {
    return updatedWith("flag", text).getBoolean("flag");
}
int numberOf(const std::string& text) {
    return updatedWith("number", text).getInt("number");
}
float ratioOf(const std::string& text) {
    return updatedWith("ratio", text).getFloat("ratio");
}
Bundle::LatLon placeOf(const std::string& text) {
    return updatedWith("place", text).getLatLon("place");
}
std::string textOf(const std::string& text) {
    return updatedWith("text", text).getString("text");
}

}  // namespace

TEST(BundleToXml, WritesAnIntegerInThreeLines) {
    Bundle bundle;
    bundle.putInt("speexquality", 8);
    EXPECT_EQ("<settings>\n<speexquality>8</speexquality>\n</settings>\n",
              bundle.toXmlString("settings"));
}

TEST(BundleToXml, WritesEveryTypeInTheOrderOfTheKeys) {
    const auto sub = boost::make_shared<Bundle>();
    sub->putString("inner", "a < b & c");
    Bundle bundle;
    bundle.putString("zz", "last");
    bundle.putBundle("tree", sub);
    bundle.putLatLon("place", {55.75222F, -0.5F});
    bundle.putFloat("ratio", 0.9F);
    bundle.putInt("number", -7);
    bundle.putBoolean("flag", true);
    bundle.putBoolean("Flag_2", false);
    EXPECT_EQ(
        "<r>\n"
        "<flag>true</flag>\n"
        "<flag2>false</flag2>\n"
        "<number>-7</number>\n"
        "<place>55.7522,-0.5</place>\n"
        "<ratio>0.9</ratio>\n"
        "<tree>\n<inner>a < b & c</inner>\n</tree>\n"
        "<zz>last</zz>\n"
        "</r>\n",
        bundle.toXmlString("r"));
}

TEST(BundleToXml, SkipsAnUnknownTypeWithALogLine) {
    Bundle::Elem elem;
    elem.type = UNKNOWN_TYPE;
    Bundle bundle;
    bundle.put("odd", elem);
    bundle.putInt("plain", 1);
    const LogCapture log;
    EXPECT_EQ("<r>\n<plain>1</plain>\n</r>\n", bundle.toXmlString("r"));
    EXPECT_THAT(log.messages(),
                ElementsAre("toXmlString: unknown element type for odd: 42; ignoring"));
}

TEST(BundleToXml, WritesAMissingSubBundleAsAnEmptyOne) {
    Bundle bundle;
    bundle.putBundle("tree", nullptr);
    EXPECT_EQ("<r>\n<tree>\n</tree>\n</r>\n", bundle.toXmlString("r"));
}

TEST(BundleFromXml, UpdatesTheEngineSettingsFromAConfigurationDocument) {
    Settings settings;
    settings.putInt(Settings::SKS_SAMPLE_RATE, 8000);
    settings.putString(Settings::SKS_ASR_POLICY_OVERRIDE, Settings::ASRO_DISABLED);
    const LogCapture log;
    settings.updateFromXml(
        "<?xml version=\"1.0\"?>\n"
        "<startup><other/><features><maps/><voice>\n"
        "  <Sample_Rate>0x3E80</Sample_Rate>\n"
        "  <asr>default</asr>\n"
        "</voice></features></startup>\n",
        Settings::XML_PATH_DFLT, Settings::bundleSpecs);
    EXPECT_EQ(16000, settings.getSampleRate());
    EXPECT_EQ("default", settings.getString(Settings::SKS_ASR_POLICY_OVERRIDE));
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(BundleFromXml, ReadsStreamingAsABoolean) {
    const struct {
        std::string text;
        bool value;
    } cases[] = {{"No", false}, {"yes", true},  {"0", false}, {"FALSE", false},
                 {"1", true},   {"nope", true}, {"00", true}, {"false.", true}};
    for (const auto& each : cases) {
        Settings settings;
        settings.putBoolean(Settings::SKS_STREAMING, !each.value);
        settings.updateFromXml("<v><Streaming>" + each.text + "</Streaming></v>", "v",
                               Settings::bundleSpecs);
        EXPECT_EQ(each.value, settings.getBoolean(Settings::SKS_STREAMING)) << each.text;
    }
}

TEST(BundleFromXml, ReadsAnElementWithoutTextAsFalseAndLogsIt) {
    for (const char* xml : {"<v><Streaming></Streaming></v>", "<v><Streaming/></v>"}) {
        Settings settings;
        settings.putBoolean(Settings::SKS_STREAMING, true);
        const LogCapture log;
        settings.updateFromXml(xml, "v", Settings::bundleSpecs);
        EXPECT_FALSE(settings.getBoolean(Settings::SKS_STREAMING));
        EXPECT_THAT(log.messages(), ElementsAre("Streaming: no body"));
    }
}

TEST(BundleFromXml, ReadsNumbers) {
    EXPECT_EQ(16000, numberOf("037200"));
    EXPECT_EQ(-16, numberOf(" -0x10 "));
    EXPECT_EQ(0.25F, ratioOf(" 2.5e-1 "));
    EXPECT_TRUE(flagOf("on"));
}

TEST(BundleFromXml, ATextThatIsNotANumberKeepsTheOldValueAndIsLogged) {
    for (const std::string text : {"nan", "-NAN", "many", "infinite", "<![CDATA[]]>", "<x/>"}) {
        Bundle bundle;
        bundle.putInt("number", 7);
        bundle.putFloat("ratio", 0.5F);
        const LogCapture log;
        bundle.updateFromXml(element("r", element("number", text) + element("ratio", text)), "r",
                             SPEC);
        EXPECT_EQ(7, bundle.getInt("number")) << text;
        EXPECT_EQ(0.5F, bundle.getFloat("ratio")) << text;
        const std::string value = text[0] != '<' ? text : text[1] == 'x' ? "x" : "";
        EXPECT_THAT(log.messages(),
                    ElementsAre("updateFromXml: value of number not a number: " + value +
                                    ", keeping the old value",
                                "updateFromXml: value of ratio not a number: " + value +
                                    ", keeping the old value"));
    }
}

TEST(BundleFromXml, AnElementWithoutTextKeepsTheOldNumber) {
    Bundle bundle;
    bundle.putInt("number", 7);
    const LogCapture log;
    bundle.updateFromXml("<r><number/></r>", "r", SPEC);
    EXPECT_EQ(7, bundle.getInt("number"));
    EXPECT_THAT(
        log.messages(),
        ElementsAre("number: no body",
                    "updateFromXml: value of number not a number: , keeping the old value"));
}

TEST(BundleFromXml, ATextThatIsNotANumberStoresZeroWhereThereIsNoOldNumber) {
    EXPECT_EQ(0, numberOf("many"));
    EXPECT_EQ(0.0F, ratioOf("nan"));
    Bundle bundle;
    bundle.putFloat("number", 0.5F);
    bundle.putInt("ratio", 7);
    bundle.updateFromXml("<r><number>x</number><ratio>x</ratio></r>", "r", SPEC);
    EXPECT_EQ(0, bundle.getInt("number"));
    EXPECT_EQ(0.0F, bundle.getFloat("ratio"));
}

TEST(BundleFromXml, ANumberBeyondTheRangeBecomesItsNearestEndAndIsLogged) {
    const LogCapture log;
    EXPECT_EQ(2147483647, numberOf("99999999999"));
    EXPECT_EQ(-2147483647 - 1, numberOf("-99999999999"));
    EXPECT_EQ(FLT_MAX, ratioOf("1e999"));
    EXPECT_EQ(-FLT_MAX, ratioOf("-1e999"));
    EXPECT_EQ(FLT_MAX, ratioOf("inf"));
    EXPECT_EQ(-FLT_MAX, ratioOf("-Infinity"));
    EXPECT_THAT(
        log.messages(),
        ElementsAre("updateFromXml: value of number out of range: 99999999999, taking the nearest",
                    "updateFromXml: value of number out of range: -99999999999, taking the nearest",
                    "updateFromXml: value of ratio out of range: 1e999, taking the nearest",
                    "updateFromXml: value of ratio out of range: -1e999, taking the nearest",
                    "updateFromXml: value of ratio out of range: inf, taking the nearest",
                    "updateFromXml: value of ratio out of range: -Infinity, taking the nearest"));
}

TEST(BundleFromXml, InfinityInAThresholdIsFoundByValidation) {
    for (const std::string text : {"inf", "-inf", "INFINITY", "1e999", "-1e999"}) {
        Settings settings;
        settings.updateFromXml(
            element("v", element("upperconfidence", text) + element("lowerconfidence", text)), "v",
            Settings::bundleSpecs);
        settings.validate();
        EXPECT_EQ(0.9F, settings.getFloat(Settings::SKS_UPPER_CONFIDENCE)) << text;
        EXPECT_EQ(0.4F, settings.getFloat(Settings::SKS_LOWER_CONFIDENCE)) << text;
    }
}

TEST(BundleFromXml, WhatFollowsANumberIsIgnoredAndLogged) {
    const LogCapture log;
    EXPECT_EQ(12, numberOf("12abc"));
    EXPECT_EQ(1, numberOf("1e99"));
    EXPECT_EQ(0.0F, ratioOf("0,5"));
    EXPECT_EQ(2.0F, placeOf("1,2,3").lon);
    EXPECT_EQ(5, numberOf("<![CDATA[5 \n]]>"));
    EXPECT_THAT(
        log.messages(),
        ElementsAre(
            "updateFromXml: value of number not only a number: 12abc, ignoring what follows it",
            "updateFromXml: value of number not only a number: 1e99, ignoring what follows it",
            "updateFromXml: value of ratio not only a number: 0,5, ignoring what follows it",
            "updateFromXml: value of place not only a number: 1,2,3, ignoring what follows it"));
}

TEST(BundleFromXml, ATextThatIsNeitherYesNorNoIsTrueAndLogged) {
    const LogCapture log;
    for (const char* text : {"yes", "TRUE", "On", "1"}) {
        EXPECT_TRUE(flagOf(text));
    }
    EXPECT_THAT(log.messages(), IsEmpty());
    EXPECT_TRUE(flagOf("off"));
    EXPECT_THAT(log.messages(),
                ElementsAre("updateFromXml: value of flag not a boolean: off, taking true"));
}

TEST(BundleFromXml, ReadsPositions) {
    EXPECT_EQ(55.75F, placeOf("55.75,37.5").lat);
    EXPECT_EQ(37.5F, placeOf("55.75,37.5").lon);
    EXPECT_EQ(-37.5F, placeOf("55.75, -37.5").lon);
}

TEST(BundleFromXml, APartOfAPositionThatDoesNotParseIsZeroAndLogged) {
    const struct {
        std::string text;
        float lat;
    } cases[] = {{"1,x", 1}, {"1", 1},   {"1 ,2", 1},  {"x,2", 0},
                 {",2", 0},  {"nan", 0}, {"nan,2", 0}, {"1,nan", 1}};
    for (const auto& each : cases) {
        Bundle bundle;
        bundle.putLatLon("place", {5, 6});
        const LogCapture log;
        bundle.updateFromXml("<r><place>" + each.text + "</place></r>", "r", SPEC);
        EXPECT_EQ(each.lat, bundle.getLatLon("place").lat) << each.text;
        EXPECT_EQ(0.0F, bundle.getLatLon("place").lon) << each.text;
        EXPECT_THAT(log.messages(), ElementsAre("updateFromXml: value of place not a position: " +
                                                each.text + ", taking 0 for what is missing"));
    }
}

TEST(BundleFromXml, APartOfAPositionBeyondTheRangeBecomesTheNearestAndIsLogged) {
    for (const std::string text : {"inf,2", "1e999,2"}) {
        const LogCapture log;
        EXPECT_EQ(FLT_MAX, placeOf(text).lat);
        EXPECT_THAT(log.messages(), ElementsAre("updateFromXml: value of place out of range: " +
                                                text + ", taking the nearest"));
    }
    const LogCapture log;
    EXPECT_EQ(-FLT_MAX, placeOf("1,-inf").lon);
    EXPECT_THAT(
        log.messages(),
        ElementsAre("updateFromXml: value of place out of range: 1,-inf, taking the nearest"));
}

TEST(BundleFromXml, ReadsTextsWithEntitiesResolved) {
    EXPECT_EQ("a<b & \"c\" \xD0\x96", textOf("a&lt;b &amp; &quot;c&quot; &#x416;"));
}

TEST(BundleFromXml, TheTextIsThatOfTheFirstChildOnly) {
    EXPECT_EQ("before", textOf("before<x/>after"));
    EXPECT_EQ(" note ", textOf("<!-- note -->value"));
}

TEST(BundleFromXml, AnyValueReplacesTheOldTypeToo) {
    Bundle bundle;
    bundle.putString("number", "text");
    bundle.updateFromXml("<r><Number>5</Number></r>", "r", SPEC);
    EXPECT_EQ(Bundle::INT, bundle.getType("number"));
    EXPECT_EQ(5, bundle.getInt("number"));
}

TEST(BundleFromXml, TheLastOfEqualNamesWins) {
    Bundle bundle;
    bundle.updateFromXml("<r><number>5</number><NUM-BER>6</NUM-BER></r>", "r", SPEC);
    EXPECT_EQ(6, bundle.getInt("number"));
}

TEST(BundleFromXml, AnUnknownNameIsLoggedAndTheRestApplied) {
    Settings settings;
    const LogCapture log;
    settings.updateFromXml("<v><Colour_Of>red</Colour_Of><language>tr-TR</language><empty/></v>",
                           "v", Settings::bundleSpecs);
    EXPECT_EQ("tr-TR", settings.getLanguage());
    EXPECT_TRUE(settings.conformsTo(Settings::bundleSpecs));
    EXPECT_THAT(
        log.messages(),
        ElementsAre("updateFromXml: unknown element name colourof, ignoring", "empty: no body",
                    "updateFromXml: unknown element name empty, ignoring"));
}

TEST(BundleFromXml, ARowWithASpelledNameIsNeverFound) {
    Bundle bundle;
    const LogCapture log;
    bundle.updateFromXml("<r><Spelled_Odd>1</Spelled_Odd></r>", "r", SPEC);
    EXPECT_FALSE(bundle.hasKey("spelledodd"));
    EXPECT_THAT(log.messages(),
                ElementsAre("updateFromXml: unknown element name spelledodd, ignoring"));
}

TEST(BundleFromXml, AMissingPathLeavesTheBundleUntouched) {
    Settings settings;
    const std::string before = settings.toXmlString("s");
    for (const char* path : {"/startup/features/voice", "Startup", "startup/asr/more"}) {
        const LogCapture log;
        settings.updateFromXml("<startup><asr>disabled</asr></startup>", path,
                               Settings::bundleSpecs);
        EXPECT_EQ(before, settings.toXmlString("s"));
        EXPECT_THAT(log.messages(),
                    ElementsAre("updateFromXml: path " + std::string(path) + " does not exist"));
    }
}

TEST(BundleFromXml, EmptyPiecesOfThePathAreSkipped) {
    for (const char* path : {"a/b", "/a/b", "//a///b/"}) {
        Bundle bundle;
        bundle.updateFromXml("<a><b><number>5</number></b></a>", path, SPEC);
        EXPECT_TRUE(bundle.hasKey("number")) << path;
    }
}

TEST(BundleFromXml, AnEmptyPathMeansTheNodeItself) {
    Bundle bundle;
    bundle.updateFromXml("<number>5</number>", "", SPEC);
    EXPECT_EQ(5, bundle.getInt("number"));
}

TEST(BundleFromXml, EachStepTakesTheFirstChildOfTheName) {
    Bundle bundle;
    const LogCapture log;
    bundle.updateFromXml("<a><b/><b><number>5</number></b></a>", "a/b", SPEC);
    EXPECT_FALSE(bundle.hasKey("number"));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(BundleFromXml, UpdatesBelowANodeOfADocument) {
    TiXmlDocument document;
    document.Parse("<a><b><number>5</number></b></a>");
    Bundle bundle;
    bundle.updateFromXml(*document.RootElement(), "b", SPEC);
    EXPECT_EQ(5, bundle.getInt("number"));
}

TEST(BundleFromXml, ASubBundleIsMadeWhereThereIsNone) {
    Bundle bundle;
    bundle.updateFromXml("<r><tree><inner>x</inner><other/></tree></r>", "r", SPEC);
    EXPECT_EQ("x", bundle.getBundle("tree")->getString("inner"));
    EXPECT_FALSE(bundle.getBundle("tree")->hasKey("other"));
}

TEST(BundleFromXml, ASharedSubBundleIsNeverChanged) {
    const auto shared = boost::make_shared<Bundle>();
    shared->putString("inner", "old");
    shared->putInt("count", 1);
    Bundle bundle;
    bundle.putBundle("tree", shared);
    bundle.updateFromXml("<r><Tree><inner>new</inner></Tree></r>", "r", SPEC);
    EXPECT_EQ("old", shared->getString("inner"));
    EXPECT_EQ("new", bundle.getBundle("tree")->getString("inner"));
    EXPECT_EQ(1, bundle.getBundle("tree")->getInt("count"));
}

TEST(BundleFromXml, AnOldValueThatIsNoBundleStays) {
    Bundle bundle;
    bundle.putInt("tree", 1);
    const LogCapture log;
    bundle.updateFromXml("<r><tree><inner>x</inner></tree><number>2</number></r>", "r", SPEC);
    EXPECT_EQ(1, bundle.getInt("tree"));
    EXPECT_EQ(2, bundle.getInt("number"));
    EXPECT_THAT(log.messages(),
                ElementsAre("updateFromXml: old value of tree not a bundle, ignoring update"));
}

TEST(BundleFromXml, AMissingSubBundleIsReplacedByANewOne) {
    Bundle bundle;
    bundle.putBundle("tree", nullptr);
    bundle.updateFromXml("<r><tree><inner>x</inner></tree></r>", "r", SPEC);
    EXPECT_EQ("x", bundle.getBundle("tree")->getString("inner"));
}

TEST(BundleFromXml, ARowOfAnotherTypeIsLoggedAndIgnored) {
    Bundle bundle;
    const LogCapture log;
    bundle.updateFromXml("<r><odd>1</odd></r>", "r", SPEC);
    EXPECT_FALSE(bundle.hasKey("odd"));
    EXPECT_THAT(log.messages(),
                ElementsAre("updateFromXml: unknown element type for odd: 42; ignoring"));
}

TEST(BundleFromXml, WithoutATableEveryNameIsUnknown) {
    Bundle bundle;
    const LogCapture log;
    bundle.updateFromXml("<r><number>1</number></r>", "r", nullptr);
    EXPECT_THAT(log.messages(),
                ElementsAre("updateFromXml: unknown element name number, ignoring"));
}

TEST(BundleFromXml, WhatIsWrittenIsReadBack) {
    Settings source;
    source.putInt(Settings::SKS_SAMPLE_RATE, 44100);
    source.putBoolean(Settings::SKS_STREAMING, true);
    source.putFloat(Settings::SKS_UPPER_CONFIDENCE, 0.75F);
    source.putLatLon(Settings::RS_MY_LL, {-33.5F, 151.25F});
    source.putString(Settings::SKS_URL, "http://127.0.0.1:8090");
    Settings copy;
    copy.updateFromXml(source.toXmlString("settings"), "settings", Settings::bundleSpecs);
    EXPECT_EQ(source.toXmlString("x"), copy.toXmlString("x"));
}
