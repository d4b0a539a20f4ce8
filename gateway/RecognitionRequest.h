#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "gateway/Answer.h"
#include "gateway/DecoderPool.h"
#include "gateway/MultipartParser.h"
#include "gateway/RequestFields.h"
#include "gateway/RequestSummary.h"
#include "gateway/SoundDecoder.h"
#include "gateway/Utterance.h"

namespace Gateway {

/** What a request says before its body. */
struct RequestHead {
    std::string method;
    std::string path;
    std::string uuid;
    std::string sessionId;
    /** The sound's content type from the query. */
    std::string soundType;
    /** The request's own Content-Type header. */
    std::string contentType;
};

/**
 * One recognition request from its head to its answer, whatever carries it.
 *
 * The body is taken in as it arrives; its sound is decoded and recognised at once. After a mistake
 * the rest of the body is taken and ignored, since the answer can only be given after it.
 */
class RecognitionRequest : private MultipartListener {
  public:
    /** Path of requests whose body arrives while the user speaks. */
    static constexpr const char* STREAMING_PATH = "/asrgw_chunked";
    /** Path of requests whose body is complete when it is sent. */
    static constexpr const char* WHOLE_PATH = "/asrgw";

    /**
     * Checks a head.
     * @param[out] boundary the boundary of the body that follows
     * @return an empty text, or the reason for status 400
     */
    static std::string checkHead(const RequestHead& head, std::string& boundary);

    /**
     * @param requestHead  as `checkHead` accepted it
     * @param boundary     from `checkHead`
     * @param decoderPool  must outlive the request
     * @param maxBodyBytes a longer body gives status 413
     */
    RecognitionRequest(const RequestHead& requestHead, const std::string& boundary,
                       DecoderPool& decoderPool, std::size_t maxBodyBytes);

    /** Takes sound as it is decoded, at the model's rate, on the thread that writes the body. */
    using SoundSink = std::function<void(const std::vector<int16_t>& samples)>;

    /** Calls `sink` with all sound from now on. */
    void setSoundSink(SoundSink sink) { soundSink = std::move(sink); }

    /** Takes more of the body. @return as `takes` for all of the body so far */
    bool write(const char* data, std::size_t size);

    /** Ends the body, waits for the decoder and gives the answer. Called once. */
    Answer finish();

    /** Whether a client may send this many bytes by mistake; beyond that the gateway hangs up. */
    bool takes(std::size_t bytes) const { return bytes / 2 <= maxBytes; }

    /**
     * Everything about the request in one line, for the log.
     * @param times fields about when it arrived, to be put among the others; may be empty
     */
    std::string describe(const std::string& times) const;

    /** What is known so far; not while another thread writes the body. */
    RequestSummary summarise() const;

    /** The hypotheses of the answer. */
    const std::vector<Hypothesis>& getHypotheses() const { return hypotheses; }

  private:
    std::string onPartBegin(const MultipartPart& part) override;
    std::string onPartData(const char* data, std::size_t size) override;
    std::string onPartEnd() override;

    std::string beginSound(const MultipartPart& part);
    std::string takeSamples(const std::vector<int16_t>& samples);
    void refuse(unsigned status, const std::string& reason);
    std::string findIncompleteness() const;
    std::string findLanguageProblem() const;
    Answer recognise();
    void endUtterance();

    const RequestHead head;
    DecoderPool& pool;
    const std::size_t maxBytes;
    MultipartParser parser;
    RequestFields fields;
    std::string soundType;
    std::unique_ptr<SoundDecoder> soundDecoder;
    std::unique_ptr<Utterance> utterance;
    SoundSink soundSink;
    bool hasSound = false;
    bool inSound = false;
    std::size_t bodyBytes = 0;
    std::size_t soundBytes = 0;
    uint64_t soundSamples = 0;
    uint64_t utteranceMs = 0;
    uint64_t decodeMs = 0;
    unsigned refusedStatus = 0;
    std::string refusedReason;
    std::vector<Hypothesis> hypotheses;
    std::string requestId;
};

}  // namespace Gateway
