#include "Catalogue.h"

namespace FaultTest {

using TestSupport::Answer;

namespace {

constexpr std::size_t EVERY_CONNECTION = 100;
constexpr std::size_t MID_BODY = 10000;

/** Every request is met by this answer. */
std::function<void(Surroundings&)> always(const Answer& answer) {
    return [answer](Surroundings& around) { around.gateway().setDefaultAnswer(answer); };
}

/** Only the first one is. */
std::function<void(Surroundings&)> once(const Answer& answer) {
    return [answer](Surroundings& around) { around.gateway().script({answer}); };
}

}  // namespace

Chapter makeConnectionFaults() {
    const Answer afterHead = Answer::resetAfter(0);
    const Answer inBody = Answer::resetAfter(MID_BODY);
    const Answer afterBody = Answer::never().thenReset();
    return {"Connections refused, reset or closed",
            {
                {"Refused",
                 "nobody listens",
                 {NETWORK_ERROR, 0},
                 {NETWORK_ERROR, 0},
                 [](Surroundings& around) { around.gateway().goAway(); }},
                {"ResetAtConnect",
                 "each connection is reset at once",
                 {NETWORK_ERROR, 0},
                 {NETWORK_ERROR, 0},
                 [](Surroundings& around) { around.gateway().resetConnections(EVERY_CONNECTION); }},
                {"ResetAtConnectOnce",
                 "the first connection is reset at once",
                 {WORDS, 1},
                 {WORDS, 1},
                 [](Surroundings& around) { around.gateway().resetConnections(1); }},
                {"ResetAfterHead",
                 "reset after the head of each request",
                 {NETWORK_ERROR, 2},
                 {NETWORK_ERROR, 2},
                 always(afterHead)},
                {"ResetAfterHeadOnce",
                 "reset after the head of the first request",
                 {WORDS, 2},
                 {WORDS, 2},
                 once(afterHead)},
                {"ResetInBody",
                 "reset in the middle of each request",
                 {NETWORK_ERROR, 2},
                 {NETWORK_ERROR, 2},
                 always(inBody)},
                {"ResetInBodyOnce",
                 "reset in the middle of the first request",
                 {WORDS, 2},
                 {WORDS, 2},
                 once(inBody)},
                {"ResetAfterBody",
                 "reset after the whole of each request",
                 {NETWORK_ERROR, 2},
                 {NETWORK_ERROR, 2},
                 always(afterBody)},
                {"ResetAfterBodyOnce",
                 "reset after the whole of the first request",
                 {WORDS, 2},
                 {WORDS, 2},
                 once(afterBody)},
                {"Closed",
                 "closed in good order after the whole of each request",
                 {NETWORK_ERROR, 2},
                 {NETWORK_ERROR, 2},
                 always(Answer::closing())},
                {"ClosedOnce",
                 "closed in good order after the whole of the first request",
                 {WORDS, 2},
                 {WORDS, 2},
                 once(Answer::closing())},
            }};
}

}  // namespace FaultTest
