#include "talvox/impl/ResultDocument.h"

#include <gtest/gtest.h>

#include <cfloat>
#include <vector>

#include "core/util/Base64Coder.h"
#include "support/LogCapture.h"

namespace {

using Results = boost::shared_ptr<Talvox::RecognitionResults>;
using TestSupport::LogCapture;

Results parse(const std::string& document) {
    return Talvox::parseResultHeader(
        Util::Base64Coder::encode(std::vector<unsigned char>(document.begin(), document.end())));
}

std::string wrap(const std::string& variants) {
    return "<recognitionResults success=\"1\">" + variants + "</recognitionResults>";
}

float parseConfidence(const std::string& text) {
    const Results results = parse(wrap("<variant confidence=\"" + text + "\">x</variant>"));
    if (!results || results->size() != 1) {
        ADD_FAILURE() << "no result for " << text;
        return -999;
    }
    return results->front().getConfidence();
}

TEST(ResultDocument, GivesVariantsInTheirOrder) {
    const LogCapture log;
    const Results results =
        parse(wrap("<variant confidence=\"0.5\">go</variant>"
                   "<variant confidence=\"0.75\">\xD0\xB4\xD0\xB0</variant>"));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 2U);
    EXPECT_EQ(results->at(0).getText(), "go");
    EXPECT_EQ(results->at(0).getConfidence(), 0.5F);
    EXPECT_EQ(results->at(1).getText(), "\xD0\xB4\xD0\xB0");
    EXPECT_EQ(results->at(1).getConfidence(), 0.75F);
    EXPECT_TRUE(log.containsPart(
        "RecognizeRequest::onResponseReceived: decoded response: <recognitionResults"));
}

TEST(ResultDocument, WithoutSuccessHasNoVariants) {
    const std::string variant = "<variant confidence=\"1\">x</variant>";
    for (const char* attribute : {"success=\"0\"", "", "success=\"yes\""}) {
        const Results results = parse(std::string("<recognitionResults ") + attribute + ">" +
                                      variant + "</recognitionResults>");
        ASSERT_TRUE(results) << attribute;
        EXPECT_TRUE(results->empty()) << attribute;
    }
}

TEST(ResultDocument, WithAnotherRootHasNoVariants) {
    const Results results = parse("<other success=\"1\"><variant>x</variant></other>");
    ASSERT_TRUE(results);
    EXPECT_TRUE(results->empty());
}

TEST(ResultDocument, AnyNonZeroSuccessCounts) {
    const Results results =
        parse("<recognitionResults success=\"-3\"><variant>x</variant></recognitionResults>");
    ASSERT_TRUE(results);
    EXPECT_EQ(results->size(), 1U);
}

TEST(ResultDocument, TakesEverySiblingAfterTheFirstVariant) {
    const Results results =
        parse(wrap("<note>before</note><variant>a</variant><note>b</note><variant>c</variant>"));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 3U);
    EXPECT_EQ(results->at(0).getText(), "a");
    EXPECT_EQ(results->at(1).getText(), "b");
    EXPECT_EQ(results->at(2).getText(), "c");
}

TEST(ResultDocument, SkipsVariantsWithoutTextWithAWarning) {
    const LogCapture log;
    const Results results =
        parse(wrap("<variant/><variant><b>x</b></variant><variant>y</variant>"));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 1U);
    EXPECT_EQ(results->front().getText(), "y");
    EXPECT_EQ(log.count("RecognizeRequest::onResponseReceived: warning: empty string in "
                        "recognitionResults"),
              2U);
}

TEST(ResultDocument, ReadsConfidencesOfAnyKind) {
    EXPECT_EQ(parseConfidence("0.25"), 0.25F);
    EXPECT_EQ(parseConfidence("-0.5"), -0.5F);
    EXPECT_EQ(parseConfidence("high"), 0.0F);
    EXPECT_EQ(parseConfidence(""), 0.0F);
    EXPECT_EQ(parseConfidence("nan"), 0.0F);
    EXPECT_EQ(parseConfidence("1e999"), FLT_MAX);
    EXPECT_EQ(parseConfidence("-1e999"), -FLT_MAX);
    const Results results = parse(wrap("<variant>x</variant>"));
    ASSERT_TRUE(results);
    EXPECT_EQ(results->front().getConfidence(), 0.0F);
}

TEST(ResultDocument, RefusesWhatIsNotBase64) {
    EXPECT_FALSE(Talvox::parseResultHeader("%%%"));
    EXPECT_FALSE(
        Talvox::parseResultHeader("PGE+"
                                  "\x80"));
}

TEST(ResultDocument, RefusesBrokenXml) {
    EXPECT_FALSE(parse(""));
    EXPECT_FALSE(parse("go forward"));
    EXPECT_FALSE(parse("<recognitionResults success=\"1\"><variant>x"));
    EXPECT_FALSE(parse("<recognitionResults success=\"1\"></variant>"));
}

TEST(ResultDocument, RefusesInvalidUtf8) {
    EXPECT_FALSE(parse(wrap("<variant>\xD0</variant>")));
    EXPECT_FALSE(parse("<a>\xF0\x9F\x98"));
}

TEST(ResultDocument, RefusesDeepNesting) {
    const LogCapture quiet;
    std::string document;
    for (int i = 0; i < 100000; ++i) {
        document += "<a>";
    }
    EXPECT_FALSE(parse(document));
}

TEST(ResultDocument, RefusesTenMegabytes) {
    const LogCapture quiet;
    EXPECT_FALSE(parse(wrap("<variant>" + std::string(std::size_t{10} << 20, 'x') + "</variant>")));
}

TEST(ResultDocument, DoesNotExpandEntitiesOfItsOwn) {
    const Results results =
        parse("<!DOCTYPE r [<!ENTITY a \"aaaaaaaaaa\"><!ENTITY b \"&a;&a;&a;&a;&a;\">]>" +
              wrap("<variant confidence=\"1\">&b;</variant>"));
    const std::string text = results && !results->empty() ? results->front().getText() : "";
    EXPECT_TRUE(text.empty() || text == "&b;") << text;
}

TEST(ResultDocument, ResolvesTheEntitiesOfXml) {
    const Results results = parse(wrap("<variant>a &lt;&amp;&gt; b&#33;</variant>"));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 1U);
    EXPECT_EQ(results->front().getText(), "a <&> b!");
}

TEST(ResultDocument, TakesTenThousandVariants) {
    const LogCapture quiet;
    std::string variants;
    for (int i = 0; i < 10000; ++i) {
        variants += "<variant confidence=\"0.5\">word " + std::to_string(i) + "</variant>";
    }
    const Results results = parse(wrap(variants));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 10000U);
    EXPECT_EQ(results->back().getText(), "word 9999");
}

TEST(ResultDocument, NeverActsAsAFormat) {
    const LogCapture log;
    const Results results = parse(wrap("<variant>100 %s %n</variant>"));
    ASSERT_TRUE(results);
    ASSERT_EQ(results->size(), 1U);
    EXPECT_EQ(results->front().getText(), "100 %s %n");
    EXPECT_TRUE(log.containsPart("<variant>100 %s %n</variant>"));
}

}  // namespace
