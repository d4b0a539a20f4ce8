#include "gateway/RecognitionRequest.h"

#include <algorithm>
#include <cstdio>
#include <random>

#include "core/util/Base64Coder.h"
#include "gateway/HeaderValue.h"
#include "gateway/LogText.h"
#include "gateway/ResultDocument.h"

namespace Gateway {

namespace {

constexpr std::size_t SOUND_PIECE_BYTES = 4096;
/** The delay after which the speech kit's clients try again. */
constexpr unsigned RETRY_AFTER_SECONDS = 2;
constexpr unsigned BUSY_STATUS = 503;

/** 128 bits nobody can guess, so that no two requests share them. */
std::string makeRequestId() {
    std::random_device random;
    std::string id;
    for (int i = 0; i < 4; ++i) {
        char part[16];
        std::snprintf(part, sizeof(part), "%08x", static_cast<unsigned>(random()));
        id += part;
    }
    return id;
}

bool isBoundary(const std::string& text) {
    return !text.empty() && text.size() <= 70 &&
           text.find_first_not_of(
               "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"
               "'()+_,-./:=? ") == std::string::npos &&
           text.back() != ' ';
}

}  // namespace

std::string RecognitionRequest::checkHead(const RequestHead& head, std::string& boundary) {
    HeaderValue type;
    if (!HeaderValue::parse(head.contentType, type) || type.value != "multipart/form-data") {
        return "the request's content type is not multipart/form-data";
    }
    const std::string* named = type.find("boundary");
    if (named == nullptr || !isBoundary(*named)) {
        return "the request's content type names no valid boundary";
    }
    if (head.uuid.empty()) {
        return "the query names no uuid";
    }
    boundary = *named;
    return std::string();
}

RecognitionRequest::RecognitionRequest(const RequestHead& requestHead, const std::string& boundary,
                                       DecoderPool& decoderPool, std::size_t maxBodyBytes)
    : head(requestHead),
      pool(decoderPool),
      maxBytes(maxBodyBytes),
      parser(boundary, *this),
      requestId(makeRequestId()) {}

bool RecognitionRequest::write(const char* data, std::size_t size) {
    // What the limit allows is read first: a mistake in it comes before the one of its length.
    const std::size_t allowed = std::min(size, maxBytes - std::min(bodyBytes, maxBytes));
    bodyBytes += size;
    if (refusedStatus == 0 && !parser.feed(data, allowed)) {
        refuse(400, parser.getError());
    }
    if (bodyBytes > maxBytes) {
        refuse(413, "the body is longer than " + std::to_string(maxBytes) + " bytes");
    }
    return takes(bodyBytes);
}

Answer RecognitionRequest::finish() {
    if (refusedStatus == 0 && !parser.finish()) {
        refuse(400, parser.getError());
    }
    for (const std::string& problem : {findIncompleteness(), findLanguageProblem()}) {
        if (!problem.empty()) {
            refuse(400, problem);
        }
    }
    Answer answer;
    if (refusedStatus == 0) {
        answer = recognise();
    }
    if (refusedStatus != 0) {
        answer = Answer::refuse(refusedStatus, refusedReason);
    }
    if (refusedStatus == BUSY_STATUS) {
        answer.headers.emplace_back("Retry-After", std::to_string(RETRY_AFTER_SECONDS));
    }
    answer.headers.emplace_back("x-kvrequestid", requestId);
    endUtterance();
    return answer;
}

std::string RecognitionRequest::describe(const std::string& times) const {
    std::string text = "uuid=" + toLogText(head.uuid);
    text += " session=" + toLogText(head.sessionId);
    text += " lang=" + toLogText(fields.get("lang"));
    text += " topic=" + toLogText(fields.get("topic"));
    text += " type=" + toLogText(soundType.empty() ? head.soundType : soundType);
    text += " bytes=" + std::to_string(bodyBytes) + " sound=" + std::to_string(soundBytes);
    text += " utterance=" + std::to_string(utteranceMs) + "ms";
    text += " decode=" + std::to_string(decodeMs) + "ms";
    text += times.empty() ? "" : " " + times;
    text += " request=" + requestId;
    if (fields.has("canceled")) {
        text += " canceled";
    }
    if (fields.has("transcripts")) {
        text += " transcripts=" + toLogText(fields.get("transcripts"));
    }
    if (soundDecoder && !soundDecoder->getRemark().empty()) {
        text += " (" + soundDecoder->getRemark() + ")";
    }
    for (const Hypothesis& hypothesis : hypotheses) {
        char confidence[16];
        std::snprintf(confidence, sizeof(confidence), "%.2f", hypothesis.confidence);
        text += std::string(" ") + confidence + ":\"" + hypothesis.text + "\"";
    }
    if (!refusedReason.empty()) {
        text += " refused: " + toLogText(refusedReason);
    }
    return text;
}

RequestSummary RecognitionRequest::summarise() const {
    RequestSummary summary;
    summary.requestId = requestId;
    summary.language = fields.get("lang");
    summary.topic = fields.get("topic");
    summary.soundType = soundType.empty() ? head.soundType : soundType;
    summary.transcripts = fields.get("transcripts");
    summary.remark = soundDecoder ? soundDecoder->getRemark() : std::string();
    summary.refusal = refusedReason;
    summary.isCanceled = fields.has("canceled");
    summary.bodyBytes = bodyBytes;
    summary.soundBytes = soundBytes;
    summary.decodeMs = utterance ? utterance->getDecodeMs() : decodeMs;
    summary.hypotheses = hypotheses;
    return summary;
}

std::string RecognitionRequest::onPartBegin(const MultipartPart& part) {
    inSound = part.name == "audio";
    return inSound ? beginSound(part) : fields.begin(part.name);
}

std::string RecognitionRequest::onPartData(const char* data, std::size_t size) {
    if (!inSound) {
        return fields.append(data, size);
    }
    soundBytes += size;
    std::string reason;
    // A few bytes of Speex may hold seconds of sound.
    while (size > 0 && reason.empty()) {
        const std::size_t count = std::min(size, SOUND_PIECE_BYTES);
        std::vector<int16_t> samples;
        reason = soundDecoder->write(data, count, samples);
        if (reason.empty()) {
            reason = takeSamples(samples);
        }
        data += count;
        size -= count;
    }
    return reason;
}

std::string RecognitionRequest::onPartEnd() {
    if (!inSound) {
        return fields.end();
    }
    std::vector<int16_t> samples;
    const std::string reason = soundDecoder->finish(samples);
    return reason.empty() ? takeSamples(samples) : reason;
}

std::string RecognitionRequest::beginSound(const MultipartPart& part) {
    if (hasSound) {
        return "the field audio stands there twice";
    }
    hasSound = true;
    const std::string missing = fields.findMissing();
    if (!missing.empty()) {
        return missing + " before the audio";
    }
    soundType = !part.contentType.empty()    ? part.contentType
                : fields.has("Content-Type") ? fields.get("Content-Type")
                                             : head.soundType;
    AudioFormat format;
    std::string reason = AudioFormat::parse(soundType, format);
    if (!reason.empty()) {
        return reason;
    }
    reason = findLanguageProblem();
    if (!reason.empty()) {
        refuse(400, reason);
        return reason;
    }
    soundDecoder = std::make_unique<SoundDecoder>(format, SpeechModel::RATE_HZ);
    // Sound that comes with transcripts is to be logged, not recognised.
    if (!fields.has("transcripts")) {
        const bool streamed = head.path == STREAMING_PATH;
        utterance = std::make_unique<Utterance>(
            pool, streamed ? Utterance::Arrival::STREAMED : Utterance::Arrival::WHOLE);
    }
    return std::string();
}

std::string RecognitionRequest::takeSamples(const std::vector<int16_t>& samples) {
    soundSamples += samples.size();
    if (soundSink) {
        soundSink(samples);
    }
    // Sound that nobody recognises is decoded all the same.
    if (soundSamples > Utterance::MAX_SAMPLES || (utterance && !utterance->add(samples))) {
        refuse(413,
               "the sound is longer than " + std::to_string(Utterance::MAX_SECONDS) + " seconds");
        return refusedReason;
    }
    return std::string();
}

void RecognitionRequest::refuse(unsigned status, const std::string& reason) {
    if (refusedStatus == 0) {
        refusedStatus = status;
        refusedReason = reason;
        endUtterance();
    }
}

std::string RecognitionRequest::findIncompleteness() const {
    if (fields.has("uuid") && fields.get("uuid") != head.uuid) {
        return "the uuid of the query and that of the body differ";
    }
    return fields.findMissing();
}

/** Transcripts are logged in any language: that takes no model. */
std::string RecognitionRequest::findLanguageProblem() const {
    const SpeechModel& model = pool.getModel();
    const std::string& language = fields.get("lang");
    if (fields.has("transcripts") || model.speaks(language)) {
        return std::string();
    }
    return "the language " + toLogText(language) + " is not available; this gateway recognises " +
           toLogText(model.language);
}

Answer RecognitionRequest::recognise() {
    Answer answer;
    if (fields.has("canceled") || fields.has("transcripts")) {
        answer.body = fields.has("canceled") ? "canceled\n" : "logged\n";
        return answer;
    }
    if (utterance) {
        const Utterance::Status status = utterance->finish(hypotheses);
        if (status == Utterance::Status::BUSY) {
            refuse(BUSY_STATUS, "all decoders are busy");
        } else if (status == Utterance::Status::FAILED) {
            refuse(500, "the decoder failed");
        }
    }
    const std::string document = makeResultDocument(hypotheses);
    answer.headers.emplace_back(
        "x-asrgw-recognition-results",
        Util::Base64Coder::encode(std::vector<unsigned char>(document.begin(), document.end())));
    answer.body = document + "\n";
    return answer;
}

void RecognitionRequest::endUtterance() {
    if (utterance) {
        utteranceMs = utterance->getDurationMs();
        decodeMs = utterance->getDecodeMs();
        // Others may be waiting for the decoder that it holds.
        utterance.reset();
    }
}

}  // namespace Gateway
