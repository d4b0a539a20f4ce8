#include "gateway/ResultDocument.h"

#include <gtest/gtest.h>
#include <tinyxml.h>

using Gateway::makeResultDocument;

TEST(ResultDocument, ListsTheVariantsInOrder) {
    EXPECT_EQ(
        "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults success=\"1\">"
        "<variant confidence=\"0.9300\">go forward</variant>"
        "<variant confidence=\"0.0501\">go for word</variant></recognitionResults>",
        makeResultDocument({{"go forward", 0.93}, {"go for word", 0.05012}}));
}

TEST(ResultDocument, SaysThatNothingWasUnderstood) {
    EXPECT_EQ(
        "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults success=\"0\">"
        "</recognitionResults>",
        makeResultDocument({}));
}

TEST(ResultDocument, KeepsConfidencesBetweenZeroAndOne) {
    const std::string document = makeResultDocument({{"a", 1.0001}, {"b", -0.5}});
    EXPECT_NE(std::string::npos, document.find("confidence=\"1.0000\">a<"));
    EXPECT_NE(std::string::npos, document.find("confidence=\"0.0000\">b<"));
}

TEST(ResultDocument, EscapesMarkup) {
    EXPECT_EQ("&lt;b&gt; &amp; &quot;it&apos;s&quot; \xc3\xa9",
              Gateway::escapeXml("<b>\n& \"it's\" \xc3\xa9").replace(9, 1, " "));
    const std::string document = makeResultDocument({{"</variant>&\"\x01'", 0.5}});
    TiXmlDocument parsed;
    parsed.Parse(document.c_str());
    ASSERT_FALSE(parsed.Error()) << parsed.ErrorDesc();
    const TiXmlElement* variant =
        parsed.FirstChildElement("recognitionResults")->FirstChildElement("variant");
    EXPECT_STREQ("</variant>&\" '", variant->GetText());
    EXPECT_EQ(nullptr, variant->NextSiblingElement());
}
