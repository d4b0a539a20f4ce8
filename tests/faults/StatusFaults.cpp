#include "Answers.h"
#include "Catalogue.h"

namespace FaultTest {

using TestSupport::Answer;

namespace {

Fault withStatus(int status, const Expected& end, const TestSupport::Headers& headers = {}) {
    const std::string text = std::to_string(status);
    return {"Status" + text, text + " without results", end, end,
            [status, headers](Surroundings& around) {
                around.gateway().setDefaultAnswer(Answer::status(status, headers));
            }};
}

Fault withResults(const std::string& status, const std::string& name, const Expected& end) {
    const Answer answer = Answer::raw(textOfGoForward("", status));
    return {name, status.substr(0, 3) + " with results", end, end,
            [answer](Surroundings& around) { around.gateway().setDefaultAnswer(answer); }};
}

Fault interim(const std::string& name, const std::string& what, const std::string& before,
              const Expected& end) {
    const Answer answer = Answer::raw(before + textOfGoForward());
    return {name, what, end, end,
            [answer](Surroundings& around) { around.gateway().setDefaultAnswer(answer); }};
}

std::string repeat(const std::string& text, int times) {
    std::string all;
    for (int i = 0; i < times; ++i) {
        all += text;
    }
    return all;
}

}  // namespace

Chapter makeStatusFaults() {
    const std::string hints = "HTTP/1.1 103 Early Hints\r\nLink: </style.css>\r\n\r\n";
    return {"Status",
            {
                interim("Continue", "100, then 200 with results", "HTTP/1.1 100 Continue\r\n\r\n",
                        {WORDS, 1}),
                interim("InterimWithResults", "results in a 103, then 200 with others",
                        "HTTP/1.1 103 Early Hints\r\nx-asrgw-recognition-results: " +
                            encode("<recognitionResults success=\"1\"><variant confidence=\"1\">"
                                   "wrong</variant></recognitionResults>") +
                            "\r\n\r\n",
                        {WORDS, 1}),
                interim("ManyInterims", "103 a hundred times, then 200 with results",
                        repeat(hints, 100), {WORDS, 1}),
                interim("TooManyInterims", "103 ten thousand times, then 200 with results",
                        repeat(hints, 10000), {NETWORK_ERROR, 2}),
                {"SwitchingProtocols",
                 "101 that nobody asked for",
                 {NETWORK_ERROR, 2},
                 {NETWORK_ERROR, 2},
                 [](Surroundings& around) {
                     around.gateway().setDefaultAnswer(
                         Answer::raw("HTTP/1.1 101 Switching Protocols\r\nUpgrade: other\r\n"
                                     "Connection: Upgrade\r\n\r\n")
                             .thenClose());
                 }},
                withStatus(200, {NETWORK_ERROR, 1}),
                withStatus(204, {NETWORK_ERROR, 1}),
                withResults("204 No Content", "ResultsWith204", {WORDS, 1}),
                withStatus(301, {NETWORK_ERROR, 1}, {{"Location", "/elsewhere"}}),
                withStatus(400, {NETWORK_ERROR, 1}),
                withStatus(404, {NETWORK_ERROR, 1}),
                withResults("404 Not Found", "ResultsWith404", {WORDS, 1}),
                withStatus(500, {NETWORK_ERROR, 2}),
                withResults("500 Oops", "ResultsWith500", {WORDS, 2}),
                withStatus(503, {NETWORK_ERROR, 2}),
                {"BusyOnce",
                 "503, then results",
                 {WORDS, 2},
                 {WORDS, 2},
                 [](Surroundings& around) { around.gateway().script({Answer::status(503)}); }},
            }};
}

}  // namespace FaultTest
