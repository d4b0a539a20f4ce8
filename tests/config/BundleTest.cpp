#include "util/Bundle.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <functional>

#include "support/AssertCapture.h"

using ::testing::ElementsAre;
using TestSupport::AssertCapture;
using Util::Bundle;

namespace {

const Bundle::ElemSpec SUB_SPEC[] = {{"inner", Bundle::STRING, nullptr},
                                     {nullptr, Bundle::BOOLEAN, nullptr}};
const Bundle::ElemSpec SPEC[] = {{"flag", Bundle::BOOLEAN, nullptr},
                                 {"ratio", Bundle::FLOAT, nullptr},
                                 {"tree", Bundle::BUNDLE, SUB_SPEC},
                                 {nullptr, Bundle::BOOLEAN, nullptr}};
const Bundle::ElemSpec NO_ROWS[] = {{nullptr, Bundle::BOOLEAN, nullptr}};

Bundle conforming() {
    Bundle bundle;
    bundle.putBoolean("flag", true);
    bundle.putFloat("ratio", 0.5F);
    const auto sub = boost::make_shared<Bundle>();
    sub->putString("inner", "text");
    bundle.putBundle("tree", sub);
    return bundle;
}

/** The texts that `action` reports; each must come from the bundle's own source path. */
std::vector<std::string> assertionsOf(const std::function<void()>& action) {
    const AssertCapture capture;
    action();
    std::vector<std::string> conditions;
    for (const auto& report : capture.reports()) {
        EXPECT_EQ("util/Bundle", report.path);
        EXPECT_GT(report.line, 0);
        conditions.push_back(report.condition);
    }
    return conditions;
}

}  // namespace

TEST(BundleKeys, DifferentSpellingsNameOneElement) {
    Bundle bundle;
    bundle.putInt("Speex_Quality", 5);
    EXPECT_EQ(5, bundle.getInt("speexquality"));
    EXPECT_TRUE(bundle.hasKey("SPEEX-QUALITY"));
    bundle.putInt("speex quality", 6);
    EXPECT_EQ(6, bundle.getInt("Speex_Quality"));
}

TEST(BundleKeys, NormalizingRemovesSeparatorsAndLowersLetters) {
    EXPECT_EQ("samplerate", Bundle::normalizeKey("Sample_Rate"));
    EXPECT_EQ("samplerate", Bundle::normalizeKey("sample-rate"));
    EXPECT_EQ("samplerate", Bundle::normalizeKey("SAMPLE RATE"));
    EXPECT_EQ("", Bundle::normalizeKey("_- -_"));
    EXPECT_EQ("", Bundle::normalizeKey(""));
}

TEST(BundleKeys, NormalizingKeepsEverythingElse) {
    EXPECT_EQ("a.b:c/1\t[\\]^`{|}~@", Bundle::normalizeKey("A.b:C/1\t[\\]^`{|}~@"));
    EXPECT_EQ("\xD0\x96\xFF", Bundle::normalizeKey("\xD0\x96\xFF"));
    EXPECT_EQ(std::string("a\0b", 3), Bundle::normalizeKey(std::string("A\0B", 3)));
}

TEST(BundleKeys, AreListedNormalizedInByteOrder) {
    Util::Bundle bundle;
    EXPECT_TRUE(bundle.getKeys().empty());
    bundle.putInt("Sample_Rate", 1);
    bundle.putInt("a", 2);
    bundle.putInt("ab", 3);
    EXPECT_EQ(bundle.getKeys(), (std::vector<std::string>{"a", "ab", "samplerate"}));
}

TEST(BundleValues, EveryTypeIsReadAsItWasStored) {
    Bundle bundle;
    const auto sub = boost::make_shared<Bundle>();
    bundle.putBoolean("b", true);
    bundle.putInt("i", -2147483647 - 1);
    bundle.putFloat("f", -0.25F);
    bundle.putLatLon("l", {55.75F, 37.5F});
    bundle.putString("s", std::string("a\0b", 3));
    bundle.putBundle("t", sub);
    EXPECT_TRUE(bundle.getBoolean("b"));
    EXPECT_EQ(-2147483647 - 1, bundle.getInt("i"));
    EXPECT_EQ(-0.25F, bundle.getFloat("f"));
    EXPECT_EQ(55.75F, bundle.getLatLon("l").lat);
    EXPECT_EQ(37.5F, bundle.getLatLon("l").lon);
    EXPECT_EQ(std::string("a\0b", 3), bundle.getString("s"));
    EXPECT_EQ(sub, bundle.getBundle("t"));
    EXPECT_EQ(Bundle::BOOLEAN, bundle.getType("b"));
    EXPECT_EQ(Bundle::INT, bundle.getType("i"));
    EXPECT_EQ(Bundle::FLOAT, bundle.getType("f"));
    EXPECT_EQ(Bundle::LATLON, bundle.getType("l"));
    EXPECT_EQ(Bundle::STRING, bundle.getType("s"));
    EXPECT_EQ(Bundle::BUNDLE, bundle.getType("t"));
}

TEST(BundleValues, TypeNumbersAreFixed) {
    EXPECT_EQ(0, Bundle::BOOLEAN);
    EXPECT_EQ(1, Bundle::INT);
    EXPECT_EQ(2, Bundle::FLOAT);
    EXPECT_EQ(3, Bundle::LATLON);
    EXPECT_EQ(4, Bundle::STRING);
    EXPECT_EQ(5, Bundle::BUNDLE);
}

TEST(BundleValues, PutReplacesTheType) {
    Bundle bundle;
    bundle.putString("k", "x");
    bundle.putInt("k", 3);
    EXPECT_EQ(Bundle::INT, bundle.getType("k"));
    EXPECT_EQ(3, bundle.getInt("k"));
    EXPECT_EQ("", bundle.get("k").text);
}

TEST(BundleValues, PutStoresAWholeElement) {
    Bundle::Elem elem;
    elem.type = Bundle::STRING;
    elem.text = "text";
    Bundle bundle;
    bundle.put("A Key", elem);
    EXPECT_EQ("text", bundle.getString("akey"));
}

TEST(BundleClone, HoldsTheSameElementsAndSharesSubBundles) {
    const Bundle source = conforming();
    const boost::shared_ptr<Bundle> copy = source.clone();
    EXPECT_TRUE(copy->conformsTo(SPEC));
    EXPECT_EQ(source.getBundle("tree"), copy->getBundle("tree"));
}

TEST(BundleClone, ChangesDoNotReachTheSource) {
    const Bundle source = conforming();
    const boost::shared_ptr<Bundle> copy = source.clone();
    copy->putFloat("ratio", 2.0F);
    copy->putInt("more", 1);
    EXPECT_EQ(0.5F, source.getFloat("ratio"));
    EXPECT_FALSE(source.hasKey("more"));
}

TEST(BundleConformance, HoldsWithAllKeysAndTypes) {
    EXPECT_TRUE(conforming().conformsTo(SPEC));
}

TEST(BundleConformance, FailsWithAnExtraKey) {
    Bundle bundle = conforming();
    bundle.putInt("more", 1);
    EXPECT_FALSE(bundle.conformsTo(SPEC));
}

TEST(BundleConformance, FailsWithoutASpecifiedKey) {
    Bundle bundle;
    bundle.putBoolean("flag", true);
    EXPECT_FALSE(bundle.conformsTo(SPEC));
}

TEST(BundleConformance, FailsWithAnotherTypeAndConvertsNothing) {
    Bundle bundle = conforming();
    bundle.putInt("ratio", 1);
    EXPECT_FALSE(bundle.conformsTo(SPEC));
}

TEST(BundleConformance, ChecksSubBundles) {
    Bundle bundle = conforming();
    const auto sub = boost::make_shared<Bundle>();
    sub->putInt("inner", 1);
    bundle.putBundle("tree", sub);
    EXPECT_FALSE(bundle.conformsTo(SPEC));
}

TEST(BundleConformance, FailsWithANullSubBundle) {
    Bundle bundle = conforming();
    bundle.putBundle("tree", nullptr);
    EXPECT_FALSE(bundle.conformsTo(SPEC));
}

TEST(BundleConformance, AnEmptyBundleConformsToATableWithoutRows) {
    EXPECT_TRUE(Bundle().conformsTo(NO_ROWS));
    EXPECT_TRUE(Bundle().conformsTo(nullptr));
    EXPECT_FALSE(conforming().conformsTo(NO_ROWS));
    EXPECT_FALSE(Bundle().conformsTo(SPEC));
}

TEST(BundleConformance, ATableMustSpellItsNamesNormalised) {
    const Bundle::ElemSpec spelled[] = {{"Sample_Rate", Bundle::INT, nullptr},
                                        {nullptr, Bundle::BOOLEAN, nullptr}};
    Bundle bundle;
    bundle.putInt("Sample_Rate", 1);
    EXPECT_FALSE(bundle.conformsTo(spelled));
}

TEST(BundleAssertions, AnEmptyBundleHasNoKey) {
    const Bundle bundle;
    EXPECT_FALSE(bundle.hasKey("k"));
    EXPECT_THAT(assertionsOf([&] { bundle.get("k"); }), ElementsAre("cit != rep.end()"));
    EXPECT_THAT(assertionsOf([&] { bundle.getType("k"); }), ElementsAre("cit != rep.end()"));
    EXPECT_FALSE(bundle.hasKey("k"));
}

TEST(BundleAssertions, AMissingKeyIsSurvivedByEveryGetterWhenTheHandlerReturns) {
    const Bundle bundle;
    EXPECT_THAT(assertionsOf([&] { EXPECT_FALSE(bundle.getBoolean("k")); }),
                ElementsAre("cit != rep.end()"));
    EXPECT_THAT(assertionsOf([&] { EXPECT_EQ(0, bundle.getInt("k")); }),
                ElementsAre("cit != rep.end()", "e.type == INT"));
    EXPECT_THAT(assertionsOf([&] { EXPECT_EQ(0.0F, bundle.getFloat("k")); }),
                ElementsAre("cit != rep.end()", "e.type == FLOAT"));
    EXPECT_THAT(assertionsOf([&] { EXPECT_EQ(0.0F, bundle.getLatLon("k").lat); }),
                ElementsAre("cit != rep.end()", "e.type == LATLON"));
    EXPECT_THAT(assertionsOf([&] { EXPECT_EQ("", bundle.getString("k")); }),
                ElementsAre("cit != rep.end()", "e.type == STRING"));
    EXPECT_THAT(assertionsOf([&] { EXPECT_FALSE(bundle.getBundle("k")); }),
                ElementsAre("cit != rep.end()", "e.type == BUNDLE"));
}

TEST(BundleAssertions, AnotherTypeIsReportedByEveryGetter) {
    Bundle bundle;
    bundle.putString("s", "x");
    bundle.putInt("i", 0x7FC00000);
    EXPECT_THAT(assertionsOf([&] { bundle.getBoolean("i"); }), ElementsAre("e.type == BOOLEAN"));
    EXPECT_THAT(assertionsOf([&] { bundle.getInt("s"); }), ElementsAre("e.type == INT"));
    EXPECT_THAT(assertionsOf([&] { bundle.getFloat("i"); }), ElementsAre("e.type == FLOAT"));
    EXPECT_THAT(assertionsOf([&] { bundle.getLatLon("s"); }), ElementsAre("e.type == LATLON"));
    EXPECT_THAT(assertionsOf([&] { bundle.getString("i"); }), ElementsAre("e.type == STRING"));
    EXPECT_THAT(assertionsOf([&] { bundle.getBundle("s"); }), ElementsAre("e.type == BUNDLE"));
}
