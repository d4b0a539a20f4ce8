#include "core/util/XmlUtils.h"

#include <gtest/gtest.h>
#include <tinyxml.h>

#include <random>
#include <thread>

#include "support/LogCapture.h"

using Util::XmlUtils;

namespace {

std::vector<unsigned char> bytesOf(const std::string& text) {
    return std::vector<unsigned char>(text.begin(), text.end());
}

bool loads(const std::string& xml) {
    TiXmlDocument document;
    return XmlUtils::load(bytesOf(xml), false, document);
}

std::string textOf(const std::string& xml, bool keepWhiteSpace = false) {
    TiXmlDocument document;
    if (!XmlUtils::load(bytesOf(xml), keepWhiteSpace, document)) {
        return "not loaded";
    }
    const char* const text = document.RootElement()->GetText();
    return text != nullptr ? text : "no text";
}

std::string repeat(const std::string& text, std::size_t count) {
    std::string repeated;
    for (std::size_t i = 0; i < count; ++i) {
        repeated += text;
    }
    return repeated;
}

std::string nested(std::size_t depth) {
    return repeat("<a>", depth) + repeat("</a>", depth);
}

/** The deepest element, without recursion. */
unsigned depthOf(const TiXmlDocument& document) {
    unsigned deepest = 0;
    unsigned depth = 0;
    const TiXmlNode* node = &document;
    while (node != nullptr) {
        deepest = std::max(deepest, depth);
        if (const TiXmlNode* const child = node->FirstChild()) {
            node = child;
            depth += child->ToElement() != nullptr ? 1 : 0;
            continue;
        }
        while (node != nullptr && node->NextSibling() == nullptr) {
            depth -= node->ToElement() != nullptr ? 1 : 0;
            node = node->Parent();
        }
        if (node != nullptr) {
            depth -= node->ToElement() != nullptr ? 1 : 0;
            node = node->NextSibling();
            depth += node->ToElement() != nullptr ? 1 : 0;
        }
    }
    return deepest;
}

TEST(XmlUtils, LoadsADocument) {
    TiXmlDocument document;
    ASSERT_TRUE(XmlUtils::load(
        bytesOf("<?xml version=\"1.0\" encoding='utf-8'?>\n<!-- <c> --><r success=\"1\">"
                "<variant confidence=\"0.5\">\xD1\x8F &lt;&#x41;&#66;</variant></r>"),
        false, document));
    const TiXmlElement* const root = document.FirstChildElement("r");
    ASSERT_NE(nullptr, root);
    int success = 0;
    EXPECT_EQ(TIXML_SUCCESS, root->QueryIntAttribute("success", &success));
    EXPECT_EQ(1, success);
    EXPECT_STREQ("\xD1\x8F <AB", root->FirstChildElement("variant")->GetText());
}

TEST(XmlUtils, TakesZeroBytesAtTheEndForNoPartOfTheText) {
    EXPECT_EQ("t", textOf(std::string("<a>t</a>\0\0", 10)));
}

TEST(XmlUtils, KeepsOrCondensesWhiteSpace) {
    EXPECT_EQ("a b", textOf("<r>  a \n b</r>"));
    EXPECT_EQ("  a \n b", textOf("<r>  a \n b</r>", true));
    EXPECT_EQ("a b", textOf("<r>  a \n b</r>"));
}

TEST(XmlUtils, KeepsWhiteSpaceApartBetweenThreads) {
    std::vector<std::thread> threads;
    for (const bool keep : {false, true}) {
        threads.emplace_back([keep] {
            for (int i = 0; i < 500; ++i) {
                ASSERT_EQ(keep ? " a  b" : "a b", textOf("<r> a  b</r>", keep));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

TEST(XmlUtils, LogsWhyATextWasRefused) {
    const TestSupport::LogCapture log;
    EXPECT_FALSE(loads("\xFF"));
    EXPECT_TRUE(log.contains("XmlUtils: the text is not UTF-8"));
    EXPECT_FALSE(loads("<a></b>"));
    EXPECT_TRUE(log.contains("XmlUtils: Error reading end tag."));
    EXPECT_FALSE(loads("<!-- nothing -->"));
    EXPECT_TRUE(log.contains("XmlUtils: no element"));
    EXPECT_FALSE(loads("<a/>garbage"));
    EXPECT_TRUE(log.contains("XmlUtils: text outside of the elements"));
}

TEST(XmlUtils, RefusesWhatIsNotXml) {
    for (const char* const xml : {"",
                                  " ",
                                  "text",
                                  "<",
                                  "<a",
                                  "<a b",
                                  "<a b=",
                                  "<a b='",
                                  "<a b='c",
                                  "<a b='c'",
                                  "<a>",
                                  "<a>t",
                                  "<a></b>",
                                  "<a><b></a></b>",
                                  "<a b=\"1\" b=\"2\"/>",
                                  "<a/",
                                  "<?xml",
                                  "<?xml ",
                                  "<?xml version='1.0'",
                                  "<?xml version='",
                                  "<a>&#",
                                  "<a>&#x",
                                  "<a>&#65"}) {
        EXPECT_FALSE(loads(xml)) << xml;
    }
}

TEST(XmlUtils, AcceptsOnlyValidUtf8) {
    const std::string good[] = {"\x7F",         "\xC2\x80",         "\xDF\xBF",
                                "\xE0\xA0\x80", "\xED\x9F\xBF",     "\xEE\x80\x80",
                                "\xEF\xBF\xBD", "\xF0\x90\x80\x80", "\xF4\x8F\xBF\xBF"};
    for (const std::string& text : good) {
        EXPECT_EQ("", XmlUtils::findHazard("<a>" + text + "</a>"));
    }
    const std::string bad[] = {"\x80",      "\xBF",         "\xC0\x80",         "\xC1\xBF",
                               "\xC2",      "\xC2 ",        "\xE0\x9F\xBF",     "\xE2\x82",
                               "\xE2\x82 ", "\xED\xA0\x80", "\xED\xBF\xBF",     "\xF0\x8F\xBF\xBF",
                               "\xF0\x9F",  "\xF0\x9F\x92", "\xF4\x90\x80\x80", "\xF5\x80\x80\x80",
                               "\xFE",      "\xFF"};
    for (const std::string& text : bad) {
        EXPECT_EQ("the text is not UTF-8", XmlUtils::findHazard("<a>" + text + "</a>"));
        EXPECT_EQ("the text is not UTF-8", XmlUtils::findHazard("<a>" + text));
    }
    EXPECT_EQ("the text is not UTF-8", XmlUtils::findHazard(std::string("<a>\0</a>", 8)));
}

TEST(XmlUtils, BoundsTheSize) {
    const std::string frame = "<a></a>";
    const std::string fitting =
        "<a>" + std::string(XmlUtils::MAX_SIZE_BYTES - frame.size(), 'x') + "</a>";
    EXPECT_EQ("", XmlUtils::findHazard(fitting));
    EXPECT_TRUE(loads(fitting));
    EXPECT_EQ("the text is too large", XmlUtils::findHazard(fitting + " "));
    EXPECT_FALSE(loads(std::string(10 * 1024 * 1024, '<')));
}

TEST(XmlUtils, BoundsTheDepth) {
    EXPECT_TRUE(loads(nested(XmlUtils::MAX_DEPTH)));
    EXPECT_EQ("elements are nested too deeply",
              XmlUtils::findHazard(nested(XmlUtils::MAX_DEPTH + 1)));
    EXPECT_FALSE(loads(nested(100000)));
    EXPECT_EQ("elements are nested too deeply", XmlUtils::findHazard(repeat("<a>", 100000)));
}

TEST(XmlUtils, CountsDepthAndNotElements) {
    EXPECT_TRUE(loads("<r>" + repeat("<v>t</v><e/><f a='/'/>", 10000) + "</r>"));
}

TEST(XmlUtils, TakesNoMarkupFromWhereThereIsNone) {
    const std::string opens = repeat("<a>", 100);
    EXPECT_TRUE(loads("<r><!-- " + opens + " --></r>"));
    EXPECT_TRUE(loads("<r><![CDATA[" + opens + "]]></r>"));
    EXPECT_TRUE(loads("<r a=\"" + opens + "\" b='" + opens + "'/>"));
    EXPECT_TRUE(loads("<?xml version='" + opens + "'?><r/>"));
}

TEST(XmlUtils, SeesElementsBehindWhatLooksLikeTheirEnd) {
    // Each of these would take the same number of levels back if it were read as closing tags.
    const std::string closings = repeat("</a>", 100);
    const std::string disguises[] = {
        "<!--" + closings + "-->",
        "<![CDATA[" + closings + "]]>",
        "<a b=\"" + closings + "\">",
        "<a b='" + closings + "'>",
        "<?xml version=\"" + closings + "\"?>",
        "<?XML  encoding = '" + closings + "'?>",
    };
    for (const std::string& disguise : disguises) {
        const std::string xml = repeat(repeat("<a>", 30) + disguise, 10);
        EXPECT_EQ("elements are nested too deeply", XmlUtils::findHazard(xml)) << disguise;
    }
}

TEST(XmlUtils, RefusesReferencesThatSwallowMarkup) {
    EXPECT_EQ("a character reference is malformed", XmlUtils::findHazard("<a>&#x</a></a>x41;</a>"));
    EXPECT_EQ("a character reference is malformed", XmlUtils::findHazard("<a>&#</a>#65;</a>"));
    EXPECT_EQ("a character reference is malformed", XmlUtils::findHazard("<a b='&#Q;'/>"));
}

TEST(XmlUtils, RefusesReferencesToWhatIsNoCharacter) {
    for (const char* const reference :
         {"&#0;", "&#x0;", "&#8;", "&#xD800;", "&#xDFFF;", "&#xFFFE;", "&#x110000;",
          "&#99999999999999999999;", "&#xFFFFFFFFFFFFFFFFF0000041;", "&#;", "&#x;"}) {
        EXPECT_EQ("a character reference names no character",
                  XmlUtils::findHazard("<a>" + std::string(reference) + "</a>"))
            << reference;
        EXPECT_NE("", XmlUtils::findHazard("<a b='" + std::string(reference) + "'/>")) << reference;
    }
    EXPECT_EQ("\xF0\x9F\x98\x80", textOf("<a>&#x1F600;</a>"));
    EXPECT_EQ("&#0;", textOf("<a><![CDATA[&#0;]]></a>"));
}

TEST(XmlUtils, MakesNothingOfEntitiesAndDocumentTypes) {
    const std::string bomb =
        "<!DOCTYPE r [<!ENTITY a \"aaaaaaaaaa\"><!ENTITY b \"&a;&a;&a;&a;&a;\">]>";
    EXPECT_FALSE(loads(bomb + "<r>&b;</r>"));
    EXPECT_FALSE(loads("<!DOCTYPE r [<!ENTITY x SYSTEM \"file:///etc/hostname\">]><r>&x;</r>"));
    EXPECT_EQ("x;", textOf("<!DOCTYPE r SYSTEM 'http://127.0.0.1/r.dtd'><r>&x;</r>"));
}

TEST(XmlUtils, BoundsTheAttributesOfAnElement) {
    std::string attributes;
    for (unsigned i = 0; i < XmlUtils::MAX_ATTRIBUTES; ++i) {
        attributes += " a" + std::to_string(i) + "='v'";
    }
    EXPECT_TRUE(loads("<r" + attributes + "/>"));
    EXPECT_EQ("an element has too many attributes",
              XmlUtils::findHazard("<r" + attributes + " b='v'/>"));
}

TEST(XmlUtils, LeavesATextThatWasCutOffToTheParser) {
    const std::string xml =
        "<?xml version='1.0'?><r><!-- c --><a b='1'>t</a><![CDATA[d]]><e/>&lt;&#65;</r>";
    for (std::size_t size = 22; size < xml.size(); ++size) {
        EXPECT_EQ("", XmlUtils::findHazard(xml.substr(0, size))) << xml.substr(0, size);
        EXPECT_FALSE(loads(xml.substr(0, size))) << xml.substr(0, size);
    }
    EXPECT_TRUE(loads(xml));
}

TEST(XmlUtils, NeverLetsADeeperTreeThrough) {
    const std::string pieces[] = {
        "<a>",      "<a>",  "<a>",  "<a>",        "<a b='c'>",  "<a b=\"d>\">", "<a b=e>",
        "</a>",     "<a/>", "<!--", "-->",        "<![CDATA[",  "]]>",          "<?xml ",
        "version=", "?>",   "<!X",  ">",          "'",          "\"",           "text",
        "&#65;",    "&#x",  ";",    "&amp;",      "&#",         "\xEF\xBB\xBF", "< a>",
        " ",        "=",    "/",    "encoding='", "<\xC3\xA4>", "</\xC3\xA4>",  "x41;",
    };
    const std::size_t count = sizeof(pieces) / sizeof(pieces[0]);
    std::mt19937 random(11);
    unsigned accepted = 0;
    unsigned deepest = 0;
    for (int round = 0; round < 20000; ++round) {
        // Mostly opening tags, so that many of the texts are too deep.
        const unsigned variety = 1 + random() % 40;
        std::string xml;
        for (unsigned length = 60 + random() % 60; length > 0; --length) {
            xml += random() % 40 < variety ? pieces[random() % count] : pieces[random() % 4];
        }
        if (!XmlUtils::findHazard(xml).empty()) {
            continue;
        }
        ++accepted;
        TiXmlDocument document;
        document.Parse(xml.c_str(), nullptr, TIXML_ENCODING_UTF8);
        const unsigned depth = depthOf(document);
        deepest = std::max(deepest, depth);
        ASSERT_LE(depth, XmlUtils::MAX_DEPTH) << xml;
    }
    // The texts are of the kind that matters.
    EXPECT_GT(accepted, 2000U);
    EXPECT_GT(deepest, XmlUtils::MAX_DEPTH / 2);
}

}  // namespace
