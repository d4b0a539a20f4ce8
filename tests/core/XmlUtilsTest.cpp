#include "core/util/XmlUtils.h"

#include <gtest/gtest.h>
#include <iconv.h>
#include <tinyxml.h>

#include <cstdint>
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
    EXPECT_FALSE(loads(std::string(10 * XmlUtils::MAX_SIZE_BYTES, '<')));
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

/** What is in the document after as much as possible of a text was parsed. */
std::string usableOf(const std::string& xml, std::string& fault) {
    TiXmlDocument document;
    document.Parse("<what was there before/>");
    fault = XmlUtils::loadUsable(xml, document);
    TiXmlPrinter printer;
    printer.SetStreamPrinting();
    document.Accept(&printer);
    return printer.CStr();
}

TEST(XmlUtilsUsable, LoadsASoundTextAsAWhole) {
    std::string fault = "unset";
    EXPECT_EQ("<r><a b=\"c\">t u</a></r>", usableOf("<r>\n<a b='c'>t \n u</a>\n</r>\n", fault));
    EXPECT_EQ("", fault);
}

TEST(XmlUtilsUsable, EndsBeforeTheElementWithTheFirstBlemish) {
    const struct {
        std::string xml;
        std::string usable;
        std::string fault;
    } cases[] = {
        {"<r><a>1</a><b>2\xFF</b><c/></r>", "<r><a>1</a></r>",
         "the text is not UTF-8 (line 1, column 16)"},
        {"<r><a>1</a>\xFF<b/></r>", "<r><a>1</a></r>", "the text is not UTF-8 (line 1, column 12)"},
        {"<r><s><a/><t x='y\xFF'/></s></r>", "<r><s><a /></s></r>",
         "the text is not UTF-8 (line 1, column 18)"},
        {"<r><a>1</a><!-- c\xFF --></r>", "<r><a>1</a></r>",
         "the text is not UTF-8 (line 1, column 18)"},
        {"<r><a>1</a></r>\xFF", "<r><a>1</a></r>", "the text is not UTF-8 (line 1, column 16)"},
        {"<r><a>1</a><b>&#65\xFF;</b></r>", "<r><a>1</a></r>",
         "the text is not UTF-8 (line 1, column 19)"},
        {"<r><a>1</a><b>&#65x;</b></r>", "<r><a>1</a></r>",
         "a character reference is malformed (line 1, column 15)"},
        {"<r><a/><b c='&#0;'/></r>", "<r><a /></r>",
         "a character reference names no character (line 1, column 14)"},
        {"<r><a/><?xml version='1.0'", "<r><a /></r>",
         "a declaration is malformed (line 1, column 27)"},
        {"<r><a/><?xml version></r>", "<r><a /></r>",
         "a declaration is malformed (line 1, column 8)"},
        {"<r><a></r>\xFF", "<r><a /></r>", "Error reading end tag. (line 1, column 7)"},
        {"<r>\xFF", "", "the text is not UTF-8 (line 1, column 4)"},
        {"\xEF\xBB\xBF<r>\xD0\x96\xFF", "", "the text is not UTF-8 (line 1, column 5)"},
        {"<r><\xC3\xA4>1</\xC3\xA4><b>\n\xD0\x96\tx\xFF", "<r><\xC3\xA4>1</\xC3\xA4></r>",
         "the text is not UTF-8 (line 2, column 4)"},
    };
    for (const auto& each : cases) {
        std::string fault;
        EXPECT_EQ(each.usable, usableOf(each.xml, fault)) << each.xml;
        EXPECT_EQ(each.fault, fault) << each.xml;
        EXPECT_FALSE(loads(each.xml)) << each.xml;
    }
}

TEST(XmlUtilsUsable, KeepsWhatTheParserHadReadAtASyntaxError) {
    std::string fault;
    EXPECT_EQ("<r><a>1</a><b>2</b></r>", usableOf("<r><a>1</a>\n\t<b>2</r>", fault));
    EXPECT_EQ("Error reading end tag. (line 2, column 6)", fault);
    EXPECT_EQ("<r><a>1</a><b>2</b></r>", usableOf("<r><a>1</a>\n<b>2", fault));
    EXPECT_EQ("Error reading Element value. (line 2, column 5)", fault);
    EXPECT_EQ("<a />", usableOf("<a/>more", fault));
    EXPECT_EQ("text outside of the elements (line 1, column 5)", fault);
    EXPECT_EQ("", usableOf("", fault));
    EXPECT_EQ("Error document empty. (line 1, column 1)", fault);
}

TEST(XmlUtilsUsable, LeavesTheDocumentEmptyBeyondTheLimits) {
    std::string attributes;
    for (unsigned i = 0; i <= XmlUtils::MAX_ATTRIBUTES; ++i) {
        attributes += " a" + std::to_string(i) + "='v'";
    }
    std::string fault;
    EXPECT_EQ("", usableOf("<r><a/>" + nested(XmlUtils::MAX_DEPTH) + "</r>", fault));
    EXPECT_EQ("elements are nested too deeply (line 1, column 199)", fault);
    EXPECT_EQ("", usableOf("<r><a/><b" + attributes + "/></r>", fault));
    EXPECT_EQ(0U, fault.find("an element has too many attributes (line 1, column "));
    EXPECT_EQ("", usableOf("<r/>" + std::string(XmlUtils::MAX_SIZE_BYTES, ' '), fault));
    EXPECT_EQ("the text is too large", fault);
}

TEST(XmlUtilsUsable, TellsOfTheFirstUnknownEntity) {
    std::string fault;
    EXPECT_EQ("<r>x;&lt;&amp;&gt;&quot;&apos;y</r>",
              usableOf("<r>&x;&lt;&amp;&gt;&quot;&apos;&y</r>", fault));
    EXPECT_EQ("an unknown entity loses its \"&\" (line 1, column 4)", fault);
    EXPECT_EQ("<r><!-- &x; --><![CDATA[&y;]]></r>",
              usableOf("<r><!-- &x; --><![CDATA[&y;]]></r>", fault));
    EXPECT_EQ("", fault);
}

/** A text of an encoding in UTF-8 by the C library's tables; empty where it has no character. */
std::string convert(const char* encoding, char byte) {
    const iconv_t conversion = iconv_open("UTF-8", encoding);
    EXPECT_NE(-1, reinterpret_cast<std::intptr_t>(conversion)) << encoding;
    char* in = &byte;
    std::size_t inLeft = 1;
    char converted[8];
    char* out = converted;
    std::size_t outLeft = sizeof converted;
    const bool isCharacter =
        iconv(conversion, &in, &inLeft, &out, &outLeft) != static_cast<std::size_t>(-1);
    iconv_close(conversion);
    return isCharacter ? std::string(converted, out) : std::string();
}

TEST(XmlUtilsUsable, ConvertsEveryCharacterOfTheEncodingsThatItKnows) {
    const struct {
        const char* name;
        const char* library;
        unsigned characters;
    } encodings[] = {{"windows-1251", "CP1251", 255}, {"CP1251", "CP1251", 255},
                     {"windows-1252", "CP1252", 251}, {"cp1252", "CP1252", 251},
                     {"ISO-8859-1", "LATIN1", 256},   {"iso8859_1", "LATIN1", 256},
                     {"Latin1", "LATIN1", 256}};
    for (const auto& encoding : encodings) {
        const TestSupport::LogCapture log;
        unsigned characters = 0;
        for (int byte = 0; byte < 256; ++byte) {
            const std::string wanted = convert(encoding.library, static_cast<char>(byte));
            characters += wanted.empty() ? 0 : 1;
            if (byte < 0x80 || wanted.empty()) {
                continue;
            }
            // The byte at the end makes sure that the text is not UTF-8.
            std::string fault;
            EXPECT_NE(std::string::npos,
                      usableOf("<?xml version='1.0' encoding='" + std::string(encoding.name) +
                                   "'?><r>" + static_cast<char>(byte) + "|\xFF</r>",
                               fault)
                          .find("<r>" + wanted + "|"))
                << encoding.name << ' ' << byte;
            EXPECT_EQ("", fault);
        }
        EXPECT_EQ(encoding.characters, characters) << encoding.name;
        EXPECT_TRUE(log.messages().empty());
    }
}

TEST(XmlUtilsUsable, ReadsItsRelativesAsLatin1AndLogsIt) {
    for (const std::string name : {"ISO-8859-15", "windows-1250", "KOI8-R", "cp866", "latin2"}) {
        const TestSupport::LogCapture log;
        std::string fault;
        const std::string usable =
            usableOf("<?xml version=\"1.0\" encoding=\"" + name + "\"?><r>\xE4</r>", fault);
        EXPECT_NE(std::string::npos, usable.find("<r>\xC3\xA4</r>")) << name;
        EXPECT_EQ("", fault);
        EXPECT_TRUE(log.contains("XmlUtils: reading encoding " + name + " as ISO-8859-1"));
    }
}

TEST(XmlUtilsUsable, BelievesTheBytesRatherThanTheDeclaration) {
    std::string fault;
    EXPECT_NE(std::string::npos,
              usableOf("<?xml version='1.0' encoding='windows-1251'?><r>\xD0\x96</r>", fault)
                  .find("<r>\xD0\x96</r>"));
    EXPECT_EQ("", fault);
    for (const std::string declaration :
         {"<?xml version='1.0' encoding='UTF-8'?>", "<?xml version='1.0' encoding='Shift_JIS'?>",
          "<?xml version='1.0' encoding='ISO-8859-1?>", "<?xml version='1.0'?>",
          "<!-- encoding='ISO-8859-1' ?> -->", " <?xml version='1.0' encoding='ISO-8859-1'?>"}) {
        EXPECT_EQ(std::string::npos, usableOf(declaration + "<r><a/>\xE4</r>", fault).find('\xC3'));
        EXPECT_NE("", fault) << declaration;
    }
}

TEST(XmlUtilsUsable, NeverHoldsADeeperTree) {
    const std::string pieces[] = {
        "<a>",  "<b>", "<a c='", "'>",   "</a>",     "</b>",   "<a/>", "<!--",      "-->", "&#65;",
        "&#0;", "&x;", "t",      "\xFF", "\xD0\x96", "<?xml ", "?>",   "<![CDATA[", "]]>"};
    const std::size_t count = sizeof(pieces) / sizeof(pieces[0]);
    std::mt19937 random(12);
    unsigned deepest = 0;
    unsigned partial = 0;
    for (int round = 0; round < 20000; ++round) {
        const unsigned variety = 1 + random() % 40;
        std::string xml;
        for (unsigned length = 60 + random() % 60; length > 0; --length) {
            xml += random() % 80 < variety ? pieces[random() % count] : pieces[random() % 2];
        }
        TiXmlDocument document;
        const std::string fault = XmlUtils::loadUsable(xml, document);
        const unsigned depth = depthOf(document);
        deepest = std::max(deepest, depth);
        partial += !fault.empty() && depth > 0 ? 1 : 0;
        ASSERT_LE(depth, XmlUtils::MAX_DEPTH) << xml;
    }
    EXPECT_GT(partial, 2000U);
    EXPECT_GT(deepest, XmlUtils::MAX_DEPTH / 2);
}

}  // namespace
