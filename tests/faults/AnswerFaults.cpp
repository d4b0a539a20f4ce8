#include "Answers.h"
#include "Catalogue.h"

namespace FaultTest {

using CloudTest::answerGoForward;
using TestSupport::Answer;

namespace {

constexpr std::size_t MID_BODY = 40000;
constexpr int64_t ANSWER_LIMIT_MS = 20000;

/** The server sends or reads one piece in each step. */
std::function<void(Surroundings&)> pieceByPiece(const Answer& answer) {
    return [answer](Surroundings& around) {
        around.gateway().setDefaultAnswer(answer);
        TestSupport::ScriptedHttpServer& gateway = around.gateway();
        around.atEachStep([&gateway](int64_t) {
            if (gateway.getRequestCount() > 0) {
                gateway.release();
            }
        });
    };
}

std::function<void(Surroundings&)> always(const Answer& answer) {
    return [answer](Surroundings& around) { around.gateway().setDefaultAnswer(answer); };
}

std::function<void(Surroundings&)> once(const Answer& answer) {
    return [answer](Surroundings& around) { around.gateway().script({answer}); };
}

/** The answer comes so long after the whole request. */
std::function<void(Surroundings&)> after(int64_t delayMs) {
    return [delayMs](Surroundings& around) {
        TestSupport::ScriptedHttpServer& gateway = around.gateway();
        gateway.setDefaultAnswer(answerGoForward().held());
        const auto complete = std::make_shared<int64_t>(-1);
        around.atEachStep([&gateway, delayMs, complete](int64_t elapsedMs) {
            if (*complete < 0 && gateway.getRequest(0).complete) {
                *complete = elapsedMs;
            }
            if (*complete >= 0 && elapsedMs == *complete + delayMs) {
                gateway.release();
            }
        });
    };
}

}  // namespace

Chapter makeAnswerFaults() {
    const std::string whole = textOfGoForward("0123456789");
    const std::string head = whole.substr(0, whole.find("\r\n\r\n") + 4);
    const Answer halfHead = Answer::raw(head.substr(0, head.size() / 2));
    const Answer halfBody = Answer::raw(whole.substr(0, whole.size() - 5));
    const Answer busy = Answer::status(503);
    return {
        "Answers that come late, early, in pieces or not at all",
        {
            {"Never", "no answer", {NETWORK_ERROR, 1}, {NETWORK_ERROR, 1}, always(Answer::never())},
            {"After10s", "the answer takes 10 s", {WORDS, 1}, {WORDS, 1}, after(10000)},
            {"JustInTime",
             "the answer takes 19.9 s",
             {WORDS, 1},
             {WORDS, 1},
             after(ANSWER_LIMIT_MS - BUFFER_MS)},
            {"JustTooLate",
             "the answer takes 20 s",
             {NETWORK_ERROR, 1},
             {NETWORK_ERROR, 1},
             after(ANSWER_LIMIT_MS)},
            {"SlowHead",
             "the head of the answer comes byte by byte, one in 0.1 s, and never ends",
             {NETWORK_ERROR, 1},
             {NETWORK_ERROR, 1},
             pieceByPiece(
                 Answer::raw("HTTP/1.1 200 OK\r\nx-slow: " + std::string(4000, 'a')).inPieces(1))},
            {"SlowBody",
             "the body of the answer comes byte by byte, one in 0.1 s, and never ends",
             {NETWORK_ERROR, 1},
             {NETWORK_ERROR, 1},
             pieceByPiece(Answer::raw("HTTP/1.1 200 OK\r\nContent-Length: 9999\r\n\r\n" +
                                      std::string(4000, 'a'))
                              .inPieces(1))},
            {"SlowBodyAfterResults",
             "the same, after a head with results",
             {NETWORK_ERROR, 1},
             {NETWORK_ERROR, 1},
             pieceByPiece(Answer::raw(textOfGoForward(std::string(4000, 'a'))).inPieces(6))},
            {"ResetInHead",
             "reset in the head of each answer",
             {NETWORK_ERROR, 2},
             {NETWORK_ERROR, 2},
             always(halfHead.thenReset())},
            {"ResetInHeadOnce",
             "reset in the head of the first answer",
             {WORDS, 2},
             {WORDS, 2},
             once(halfHead.thenReset())},
            {"ClosedInHead",
             "closed in the head of each answer",
             {NETWORK_ERROR, 2},
             {NETWORK_ERROR, 2},
             always(halfHead.thenClose())},
            {"ResetInAnswersBody",
             "reset in the body of each answer, after the results",
             {WORDS, 2},
             {WORDS, 2},
             always(halfBody.thenReset())},
            {"ClosedInAnswersBody",
             "closed in the body of each answer, after the results",
             {WORDS, 2},
             {WORDS, 2},
             always(halfBody.thenClose())},
            {"ResultsAtHead",
             "results as soon as the head of the request is there",
             {WORDS, 1},
             {WORDS, 1},
             always(answerGoForward().onHead())},
            {"ResultsInMidBody",
             "results in the middle of the request",
             {WORDS, 1},
             {WORDS, 1},
             always(answerGoForward().afterBodyBytes(MID_BODY))},
            {"ResultsInMidBodyAndClosed",
             "results in the middle of the request, then closed",
             {WORDS, 1},
             {WORDS, 1},
             always(answerGoForward().afterBodyBytes(MID_BODY).thenClose())},
            {"BusyInMidBody",
             "503 in the middle of each request",
             {NETWORK_ERROR, 2},
             {NETWORK_ERROR, 2},
             always(busy.afterBodyBytes(MID_BODY))},
            {"BusyInMidBodyOnce",
             "503 in the middle of the first request",
             {WORDS, 2},
             {WORDS, 2},
             once(busy.afterBodyBytes(MID_BODY))},
            {"RefusedInMidBody",
             "400 in the middle of the request",
             {NETWORK_ERROR, 1},
             {NETWORK_ERROR, 1},
             always(Answer::status(400).afterBodyBytes(MID_BODY))},
            {"NotHttp",
             "an answer that is not HTTP",
             {NETWORK_ERROR, 2},
             {NETWORK_ERROR, 2},
             always(Answer::raw("220 mail.example ESMTP ready\r\n").thenClose())},
        }};
}

}  // namespace FaultTest
