#include "Answers.h"
#include "Catalogue.h"

namespace FaultTest {

namespace {

Fault withDocument(const std::string& name, const std::string& what, const std::string& end,
                   const std::string& document) {
    const Expected expected{end, 1};
    return {name, what, expected, expected, [document](Surroundings& around) {
                around.gateway().setDefaultAnswer(CloudTest::answerDocument(document));
            }};
}

std::string results(const std::string& content, const std::string& success = "1") {
    return "<recognitionResults success=\"" + success + "\">" + content + "</recognitionResults>";
}

std::string nest(int depth) {
    std::string open;
    std::string close;
    for (int i = 0; i < depth; ++i) {
        open += "<a>";
        close += "</a>";
    }
    return open + close;
}

std::string makeEntityBomb() {
    std::string document = "<!DOCTYPE r [<!ENTITY a0 \"ha\">";
    for (int i = 1; i < 30; ++i) {
        const std::string before = "&a" + std::to_string(i - 1) + ";";
        document += "<!ENTITY a" + std::to_string(i) + " \"";
        document += before;
        document += before;
        document += "\">";
    }
    return document + "]>" + results("<variant confidence=\"0.95\">&a29;</variant>");
}

}  // namespace

Chapter makeDocumentFaults() {
    const std::string variant = "<variant confidence=\"0.95\">go forward</variant>";
    return {"The results document",
            {
                withDocument("Empty", "nothing", NETWORK_ERROR, ""),
                withDocument("NotXml", "not XML", NETWORK_ERROR, "go forward"),
                withDocument("Truncated", "cut off in a variant", NETWORK_ERROR,
                             results(variant).substr(0, 60)),
                withDocument("TruncatedInUtf8", "cut off in a character", NETWORK_ERROR,
                             "<recognitionResults success=\"1\"><variant>\xE2\x82"),
                withDocument("NotUtf8", "in UTF-16", NETWORK_ERROR,
                             std::string("\xFF\xFE<\0a\0/\0>\0", 10)),
                withDocument("EntityBomb", "entities that grow to a billion letters", NETWORK_ERROR,
                             makeEntityBomb()),
                withDocument("ForeignEntity", "an entity that names a file", NETWORK_ERROR,
                             "<!DOCTYPE r [<!ENTITY x SYSTEM \"file:///etc/passwd\">]>" +
                                 results("<variant confidence=\"0.95\">&x;</variant>")),
                withDocument("Deep", "elements in 5,000 levels", NETWORK_ERROR,
                             results(nest(5000) + variant)),
                withDocument("WrongRoot", "another root", NO_WORDS,
                             "<results success=\"1\">" + variant + "</results>"),
                withDocument("NoSuccess", "no success, with a variant", NO_WORDS,
                             results(variant, "0")),
                withDocument("OddSuccess", "a success that is no number", NO_WORDS,
                             results(variant, "yes")),
                withDocument("EmptyVariant", "an empty variant before a good one", WORDS,
                             results("<variant confidence=\"0.95\"/>" + variant)),
                withDocument("NoConfidence", "a confidence that is no number", WORDS,
                             results("<variant confidence=\"high\">go forward</variant>")),
                withDocument("HugeConfidence", "a confidence beyond all numbers", WORDS,
                             results("<variant confidence=\"1e999999\">go forward</variant>")),
                withDocument("NanConfidence", "a confidence of NaN", WORDS,
                             results("<variant confidence=\"nan\">go forward</variant>")),
                withDocument("TextAfterRoot", "words after the root", NETWORK_ERROR,
                             results(variant) + " and more"),
            }};
}

}  // namespace FaultTest
