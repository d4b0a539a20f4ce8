#include "gateway/RecognitionRequest.h"

#include <gtest/gtest.h>

#include "core/util/Base64Coder.h"
#include "gateway/Bodies.h"
#include "gateway/RecordedSpeech.h"
#include "gateway/SharedPool.h"

namespace {

using namespace GatewayTest;
using Gateway::Answer;
using Gateway::RecognitionRequest;
using Gateway::RequestHead;

constexpr std::size_t MAX_BODY = std::size_t{1024} * 1024;

RequestHead usualHead(const std::string& soundType = "") {
    RequestHead head;
    head.method = "POST";
    head.path = "/asrgw_chunked";
    head.uuid = "u1";
    head.sessionId = "s1";
    head.soundType = soundType;
    head.contentType = std::string("multipart/form-data; boundary=") + BOUNDARY;
    return head;
}

struct Outcome {
    Answer answer;
    std::string line;
    std::vector<Gateway::Hypothesis> hypotheses;
};

Outcome run(const std::string& body, const RequestHead& head = usualHead(),
            std::size_t piece = 4096) {
    RecognitionRequest request(head, BOUNDARY, sharedPool(), MAX_BODY);
    for (std::size_t i = 0; i < body.size(); i += piece) {
        EXPECT_TRUE(request.write(body.data() + i, std::min(piece, body.size() - i)));
    }
    Outcome outcome;
    outcome.answer = request.finish();
    outcome.line = request.describe("pieces=3");
    outcome.hypotheses = request.getHypotheses();
    return outcome;
}

std::string header(const Answer& answer, const std::string& name) {
    for (const auto& candidate : answer.headers) {
        if (candidate.first == name) {
            return candidate.second;
        }
    }
    return "missing";
}

std::string document(const Answer& answer) {
    std::vector<unsigned char> bytes;
    if (!Util::Base64Coder::decode(header(answer, "x-asrgw-recognition-results"), bytes)) {
        return "no base64";
    }
    return std::string(bytes.begin(), bytes.end());
}

const std::string& pcm() {
    static const std::string bytes = toPcm(readRecording("goforward.raw"));
    return bytes;
}

const char* const NOTHING_UNDERSTOOD =
    "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults success=\"0\">"
    "</recognitionResults>";

void expectRefused(const std::string& body, const std::string& reason,
                   const RequestHead& head = usualHead()) {
    const Outcome outcome = run(body, head);
    EXPECT_EQ(400U, outcome.answer.status) << reason;
    EXPECT_NE(std::string::npos, outcome.answer.body.find(reason))
        << outcome.answer.body << "instead of " << reason;
    EXPECT_EQ("missing", header(outcome.answer, "x-asrgw-recognition-results"));
    EXPECT_NE(std::string::npos, outcome.line.find("refused: "));
}

}  // namespace

TEST(RecognitionRequest, AnswersWithTheHypotheses) {
    const Outcome outcome = run(bodyWithSound(pcm(), PCM16K));
    EXPECT_EQ(200U, outcome.answer.status);
    const std::string text = document(outcome.answer);
    EXPECT_EQ(0U, text.find("<?xml version=\"1.0\" encoding=\"utf-8\"?>"
                            "<recognitionResults success=\"1\"><variant confidence=\"0."))
        << text;
    EXPECT_NE(std::string::npos, text.find("\">go forward ten meters</variant>"));
    EXPECT_EQ(text + "\n", outcome.answer.body);
}

TEST(RecognitionRequest, GivesTheSameAnswerFromSmallPieces) {
    const std::string whole = document(run(bodyWithSound(pcm(), PCM16K)).answer);
    EXPECT_EQ(whole, document(run(bodyWithSound(pcm(), PCM16K), usualHead(), 61).answer));
    EXPECT_EQ(whole, document(run(bodyWithSound(pcm(), PCM16K), usualHead(), 1).answer));
}

TEST(RecognitionRequest, RecognisesSpeexAndTelephoneSound) {
    const std::vector<int16_t> samples = readRecording("something.raw");
    for (const auto& sound : Fields{{encodeWithSpeexenc(samples, 16000, "wideband"), SPEEX},
                                    {toPcm(halveRate(samples)), PCM8K}}) {
        const Outcome outcome = run(bodyWithSound(sound.first, sound.second));
        ASSERT_FALSE(outcome.hypotheses.empty()) << sound.second;
        EXPECT_EQ("go somewhere and do something", outcome.hypotheses[0].text) << sound.second;
    }
    // A narrow band and a codec on top of it cost the model some words, not the sentence.
    const Outcome outcome =
        run(bodyWithSound(encodeWithSpeexenc(halveRate(samples), 8000, "narrowband"), SPEEX));
    ASSERT_FALSE(outcome.hypotheses.empty());
    EXPECT_EQ(0U, outcome.hypotheses[0].text.find("go somewhere and "))
        << outcome.hypotheses[0].text;
}

TEST(RecognitionRequest, GivesEachAnswerAFreshIdentifier) {
    const std::string first = header(run(parts(usualFields()) + closing()).answer, "x-kvrequestid");
    const std::string second =
        header(run(parts(usualFields()) + closing()).answer, "x-kvrequestid");
    EXPECT_EQ(32U, first.size());
    EXPECT_EQ(std::string::npos, first.find_first_not_of("0123456789abcdef"));
    EXPECT_NE(first, second);
}

TEST(RecognitionRequest, FindsTheSoundTypeInPartFieldOrQuery) {
    const std::string before = parts(usualFields());
    const std::string field = part("Content-Type", PCM16K);
    const std::string untyped = part("audio", pcm());
    EXPECT_FALSE(run(before + part("audio", pcm(), PCM16K) + closing()).hypotheses.empty());
    EXPECT_FALSE(run(before + field + untyped + closing()).hypotheses.empty());
    EXPECT_FALSE(run(before + untyped + closing(), usualHead(PCM16K)).hypotheses.empty());
    // What stands nearest to the sound counts.
    EXPECT_FALSE(
        run(before + part("Content-Type", SPEEX) + part("audio", pcm(), PCM16K) + closing(),
            usualHead("nonsense"))
            .hypotheses.empty());
    expectRefused(before + untyped + closing(), "the audio's content type is malformed");
}

TEST(RecognitionRequest, UnderstandsNothingWithoutSound) {
    for (const std::string& body :
         {parts(usualFields()) + closing(), bodyWithSound("", PCM16K), bodyWithSound("", SPEEX),
          bodyWithSound(std::string(32000, '\0'), PCM16K)}) {
        const Outcome outcome = run(body);
        EXPECT_EQ(200U, outcome.answer.status);
        EXPECT_EQ(NOTHING_UNDERSTOOD, document(outcome.answer));
    }
}

TEST(RecognitionRequest, RefusesLanguagesWithoutAModel) {
    const std::string reason = "the language ru-RU is not available; this gateway recognises en\n";
    const std::string sound = part("audio", pcm(), PCM16K);
    for (const std::string& body :
         {bodyWithSound(pcm(), PCM16K, "ru-RU"), parts(usualFields("ru-RU")) + closing(),
          parts(usualFields("ru-RU")) + sound + part("canceled", "true") + closing()}) {
        const Outcome outcome = run(body);
        EXPECT_EQ(400U, outcome.answer.status);
        EXPECT_EQ(reason, outcome.answer.body);
        EXPECT_EQ("missing", header(outcome.answer, "x-asrgw-recognition-results"));
        EXPECT_NE(std::string::npos, outcome.line.find(" lang=ru-RU "));
        EXPECT_NE(std::string::npos,
                  outcome.line.find(" refused: \"the language ru-RU is not available; this gateway "
                                    "recognises en\""));
        EXPECT_NE(std::string::npos, outcome.line.find(" decode=0ms"));
    }
}

TEST(RecognitionRequest, NamesAnUnknownLanguageSafely) {
    const Outcome outcome =
        run(parts(usualFields("\xff\r\n" + std::string(4000, 'x'))) + closing());
    EXPECT_EQ(400U, outcome.answer.status);
    EXPECT_EQ(0U, outcome.answer.body.find("the language \\xff\\x0d\\x0axxx"))
        << outcome.answer.body;
    EXPECT_NE(std::string::npos,
              outcome.answer.body.find("xxx... is not available; this gateway recognises en\n"));
    EXPECT_GT(500U, outcome.answer.body.size());
}

TEST(RecognitionRequest, LogsTranscriptsInAnyLanguage) {
    const Outcome outcome = run(parts(usualFields("ru-RU")) + part("transcripts", "<a/>") +
                                part("audio", pcm(), PCM16K) + closing());
    EXPECT_EQ(200U, outcome.answer.status);
    EXPECT_EQ("logged\n", outcome.answer.body);
}

TEST(RecognitionRequest, RefusesForAWhileWhenAllDecodersAreBusy) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1, 0);
    Gateway::DecoderPool::Lease other = pool.tryAcquire();
    ASSERT_TRUE(other);
    const std::string body = bodyWithSound(pcm(), PCM16K);
    RecognitionRequest refused(usualHead(), BOUNDARY, pool, MAX_BODY);
    EXPECT_TRUE(refused.write(body.data(), body.size()));
    const Answer answer = refused.finish();
    EXPECT_EQ(503U, answer.status);
    EXPECT_EQ("all decoders are busy\n", answer.body);
    EXPECT_EQ("2", header(answer, "Retry-After"));
    EXPECT_NE("missing", header(answer, "x-kvrequestid"));
    EXPECT_NE(std::string::npos, refused.describe("").find(" refused: \"all decoders are busy\""));
    other.reset();
    RecognitionRequest next(usualHead(), BOUNDARY, pool, MAX_BODY);
    EXPECT_TRUE(next.write(body.data(), body.size()));
    const Answer served = next.finish();
    EXPECT_EQ(200U, served.status);
    EXPECT_EQ("missing", header(served, "Retry-After"));
    EXPECT_EQ("go forward ten meters", next.getHypotheses().at(0).text);
}

TEST(RecognitionRequest, BorrowsADecoderEarlyWhereTheSoundIsStreamed) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1, 0);
    const std::string begun = parts(usualFields()) + part("audio", pcm() + pcm(), PCM16K);
    for (const bool streamed : {true, false}) {
        RequestHead head = usualHead();
        head.path = streamed ? "/asrgw_chunked" : "/asrgw";
        RecognitionRequest request(head, BOUNDARY, pool, MAX_BODY);
        EXPECT_TRUE(request.write(begun.data(), begun.size()));
        EXPECT_EQ(streamed, pool.tryAcquire() == nullptr);
    }
}

TEST(RecognitionRequest, DropsACanceledUtterance) {
    const std::string body =
        parts(usualFields()) + part("audio", pcm(), PCM16K) + part("canceled", "true") + closing();
    const Outcome outcome = run(body);
    EXPECT_EQ(200U, outcome.answer.status);
    EXPECT_EQ("canceled\n", outcome.answer.body);
    EXPECT_EQ("missing", header(outcome.answer, "x-asrgw-recognition-results"));
    EXPECT_NE("missing", header(outcome.answer, "x-kvrequestid"));
    EXPECT_TRUE(outcome.hypotheses.empty());
    EXPECT_NE(std::string::npos, outcome.line.find(" canceled"));
}

TEST(RecognitionRequest, LogsTranscriptsInsteadOfRecognising) {
    const std::string body = parts(usualFields()) + part("transcripts", "<a>\n  b") +
                             part("Content-Type", PCM16K) + part("audio", pcm(), PCM16K) +
                             closing();
    const Outcome outcome = run(body);
    EXPECT_EQ(200U, outcome.answer.status);
    EXPECT_EQ("logged\n", outcome.answer.body);
    EXPECT_TRUE(outcome.hypotheses.empty());
    EXPECT_NE(std::string::npos, outcome.line.find("transcripts=\"<a>\\x0a  b\""));
    EXPECT_NE(std::string::npos, outcome.line.find(" decode=0ms"));
}

TEST(RecognitionRequest, DescribesItselfInOneLine) {
    const std::string body = bodyWithSound(pcm(), PCM16K);
    RequestHead head = usualHead();
    head.sessionId = "two words\r\n";
    const Outcome outcome = run(body, head);
    const std::string expected =
        "uuid=u1 session=\"two words\\x0d\\x0a\" lang=en-US "
        "topic=freeform type=audio/x-pcm;bit=16;rate=16000 bytes=" +
        std::to_string(body.size()) + " sound=89160 utterance=2786ms decode=";
    EXPECT_EQ(expected, outcome.line.substr(0, expected.size()));
    EXPECT_NE(std::string::npos,
              outcome.line.find(" request=" + header(outcome.answer, "x-kvrequestid") + " 0."));
    EXPECT_NE(std::string::npos, outcome.line.find(":\"go forward ten meters\""));
}

TEST(RecognitionRequest, JudgesTheHead) {
    std::string boundary;
    EXPECT_EQ("", RecognitionRequest::checkHead(usualHead(), boundary));
    EXPECT_EQ(BOUNDARY, boundary);
    RequestHead head = usualHead();
    head.uuid.clear();
    EXPECT_EQ("the query names no uuid", RecognitionRequest::checkHead(head, boundary));
    for (const char* type : {"", "text/plain", "multipart/mixed; boundary=a"}) {
        head = usualHead();
        head.contentType = type;
        EXPECT_EQ("the request's content type is not multipart/form-data",
                  RecognitionRequest::checkHead(head, boundary));
    }
    for (const std::string& value :
         {std::string(), std::string("\"\""), std::string("\"a \""), std::string("a\"b"),
          std::string(71, 'x'), std::string("\"a\xff\"")}) {
        head = usualHead();
        head.contentType = "multipart/form-data; boundary=" + value;
        EXPECT_EQ("the request's content type names no valid boundary",
                  RecognitionRequest::checkHead(head, boundary))
            << value;
    }
}

TEST(RecognitionRequest, RefusesBodiesWithMissingFields) {
    for (std::size_t missing = 0; missing < usualFields().size(); ++missing) {
        Fields fields = usualFields();
        const std::string name = fields[missing].first;
        fields.erase(fields.begin() + static_cast<std::ptrdiff_t>(missing));
        expectRefused(parts(fields) + closing(), "the field " + name + " is missing");
        expectRefused(parts(fields) + part("audio", pcm(), PCM16K) + closing(),
                      "the field " + name + " is missing before the audio");
    }
}

TEST(RecognitionRequest, RefusesFieldsWithWrongValues) {
    for (const auto& wrong : Fields{{"uuid", "the field uuid is empty"},
                                    {"lang", "the field lang is empty"},
                                    {"topic", "the field topic is empty"}}) {
        expectRefused(part(wrong.first, "") + closing(), wrong.second);
    }
    for (const char* value :
         {"", "1", "1,", ",1", "1,2,3", "a,b", "1.0, 2.0", "nan,1", "1e999,1"}) {
        expectRefused(part("myll", value) + closing(), "the field myll is not two numbers");
        expectRefused(part("centerll", value) + closing(), "the field centerll is not two numbers");
    }
    expectRefused(part("canceled", "false") + closing(), "the field canceled has another value");
    expectRefused(part("uuid", "u1") + part("uuid", "u1") + closing(),
                  "the field uuid stands there twice");
    expectRefused(part("topic", std::string(4097, 'x')) + closing(), "the field topic is too long");
    Fields fields = usualFields();
    fields[0].second = "other";
    expectRefused(parts(fields) + closing(), "the uuid of the query and that of the body differ");
}

TEST(RecognitionRequest, RefusesSoundThatItCannotDecode) {
    expectRefused(bodyWithSound(pcm(), SPEEX), "the sound is not an Ogg stream");
    expectRefused(bodyWithSound("OggS", SPEEX), "the sound holds no Speex header");
    expectRefused(bodyWithSound(pcm(), "audio/mpeg"), "the audio's content type is not supported");
    expectRefused(parts(usualFields()) + part("audio", pcm(), PCM16K) +
                      part("audio", pcm(), PCM16K) + closing(),
                  "the field audio stands there twice");
}

TEST(RecognitionRequest, RefusesMalformedBodies) {
    const std::string body = bodyWithSound(pcm(), PCM16K);
    expectRefused("", "the body ends before its final boundary");
    expectRefused(body.substr(0, body.size() / 2), "the body ends before its final boundary");
    expectRefused("nonsense", "the body does not begin with the boundary");
    expectRefused(body + "more", "bytes follow the final boundary");
}

TEST(RecognitionRequest, RefusesBodiesThatAreTooLong) {
    RecognitionRequest request(usualHead(), BOUNDARY, sharedPool(), 1000);
    const std::string body = bodyWithSound(pcm(), PCM16K);
    EXPECT_TRUE(request.write(body.data(), 1000));
    EXPECT_TRUE(request.write(body.data() + 1000, 1001));
    // Nobody sends twice as much by mistake.
    EXPECT_FALSE(request.write(body.data() + 2001, 1));
    const Answer answer = request.finish();
    EXPECT_EQ(413U, answer.status);
    EXPECT_EQ("the body is longer than 1000 bytes\n", answer.body);
}

TEST(RecognitionRequest, NamesTheFirstMistakeOfABodyThatIsTooLongHoweverItArrives) {
    for (const std::size_t piece : {1U, 100U, 1500U}) {
        RecognitionRequest request(usualHead(), BOUNDARY, sharedPool(), 1000);
        const std::string body(1500, 'x');
        for (std::size_t at = 0; at < body.size(); at += piece) {
            EXPECT_TRUE(request.write(body.data() + at, piece));
        }
        EXPECT_EQ(400U, request.finish().status) << piece;
    }
}

TEST(RecognitionRequest, RefusesSoundThatIsTooLong) {
    const std::string sound =
        part("audio", std::string(std::size_t{121} * 32000, '\0'), PCM16K) + closing();
    // Sound that is only logged has the same limit as sound that is recognised.
    for (const std::string& transcripts : {std::string(), part("transcripts", "<a/>")}) {
        RecognitionRequest request(usualHead(), BOUNDARY, sharedPool(), 16 * MAX_BODY);
        std::string body = parts(usualFields());
        body += transcripts;
        body += sound;
        EXPECT_TRUE(request.write(body.data(), body.size()));
        const Answer answer = request.finish();
        EXPECT_EQ(413U, answer.status) << transcripts;
        EXPECT_EQ("the sound is longer than 120 seconds\n", answer.body) << transcripts;
    }
}
