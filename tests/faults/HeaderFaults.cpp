#include "Answers.h"
#include "Catalogue.h"

namespace FaultTest {

using TestSupport::Answer;

namespace {

const char* const RESULTS = "x-asrgw-recognition-results";

Fault withHeaders(const std::string& name, const std::string& what, const Expected& end,
                  const TestSupport::Headers& headers) {
    return {name, what, end, end, [headers](Surroundings& around) {
                around.gateway().setDefaultAnswer(Answer::status(200, headers));
            }};
}

/** "go forward" and then as many variants as make the document so long. */
std::string makeLongDocument(std::size_t size) {
    const std::string variant = "<variant confidence=\"0.1\">and so on</variant>";
    std::string document =
        "<recognitionResults success=\"1\"><variant confidence=\"0.95\">go forward</variant>";
    while (document.size() < size) {
        document += variant;
    }
    return document + "</recognitionResults>";
}

}  // namespace

Chapter makeHeaderFaults() {
    const std::string good = encodedGoForward();
    const std::string other = encode(
        "<recognitionResults success=\"1\"><variant confidence=\"1\">other</variant>"
        "</recognitionResults>");
    return {
        "The results header",
        {
            withHeaders("HeaderMissing", "missing, with a request identifier", {NETWORK_ERROR, 1},
                        {{"x-kvrequestid", "request-1"}}),
            withHeaders("HeaderEmpty", "empty", {NETWORK_ERROR, 1}, {{RESULTS, ""}}),
            withHeaders("HeaderLong", "60,000 bytes", {WORDS, 1},
                        {{RESULTS, encode(makeLongDocument(44000))}}),
            withHeaders("HeaderTooLong", "300,000 bytes", {NETWORK_ERROR, 2},
                        {{RESULTS, encode(makeLongDocument(220000))}}),
            withHeaders("HeadTooLong", "good, after 300,000 bytes of others", {NETWORK_ERROR, 2},
                        [&good] {
                            TestSupport::Headers headers;
                            for (int i = 0; i < 100; ++i) {
                                headers.emplace_back("x-other", std::string(3000, 'a'));
                            }
                            headers.emplace_back(RESULTS, good);
                            return headers;
                        }()),
            withHeaders("HeaderRepeated", "twice, with different results: the first counts",
                        {WORDS, 1}, {{RESULTS, good}, {RESULTS, other}}),
            withHeaders("HeaderRepeatedBroken", "twice, the first one broken", {NETWORK_ERROR, 1},
                        {{RESULTS, "?"}, {RESULTS, good}}),
            withHeaders("NotBase64", "not base64", {NETWORK_ERROR, 1},
                        {{RESULTS, "<recognitionResults success=\"1\"/>"}}),
            withHeaders("Base64CutOff", "base64 that is cut off", {NETWORK_ERROR, 1},
                        {{RESULTS, good.substr(0, good.size() - 5)}}),
            withHeaders("OtherCase", "its name in capitals, its value between blanks", {WORDS, 1},
                        {{"X-ASRGW-RECOGNITION-RESULTS", "  " + good + " \t "}}),
        }};
}

}  // namespace FaultTest
