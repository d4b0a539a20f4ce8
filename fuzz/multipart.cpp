/* One byte, the request's content type in a line, the body: the answer must not depend on how the
 * body is cut into pieces. */
#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "Fuzz.h"
#include "gateway/DecoderPool.h"
#include "gateway/MultipartParser.h"
#include "gateway/RecognitionRequest.h"

namespace {

using Fuzz::require;

constexpr std::size_t MAX_BODY_BYTES = 1500;

/** How a body arrives. */
class Cut {
  public:
    /** @param start 0: in one piece; 1: byte by byte; else at random */
    explicit Cut(uint32_t start) : state(start) {}

    std::size_t next(std::size_t left) {
        if (state < 2) {
            return state == 0 ? left : 1;
        }
        state = state * 1664525U + 1013904223U;
        const std::size_t most = (state >> 28U) < 8 ? 4 : 600;
        return std::min<std::size_t>(left, 1 + (state >> 8U) % most);
    }

  private:
    uint32_t state;
};

/** Writes all that a parser says into one text. */
class Transcript : public Gateway::MultipartListener {
  public:
    explicit Transcript(std::size_t mostBytes) : bytesLeft(mostBytes) {}

    std::string onPartBegin(const Gateway::MultipartPart& part) override {
        require(!isInPart, "parts do not overlap");
        require(!part.name.empty(), "a part has a name");
        isInPart = true;
        contents.emplace_back();
        text += "\n[" + part.name + "|" + part.contentType + "]";
        return part.name == "refused" ? "a refused part" : "";
    }
    std::string onPartData(const char* data, std::size_t size) override {
        require(isInPart && size > 0, "data belongs to a part");
        text.append(data, std::min(size, bytesLeft));
        contents.back().append(data, size);
        const bool isTooMuch = size > bytesLeft;
        bytesLeft -= std::min(size, bytesLeft);
        return isTooMuch ? "too much data" : "";
    }
    std::string onPartEnd() override {
        require(isInPart, "a part ends once");
        isInPart = false;
        text += "[end]";
        return "";
    }

    std::string text;
    std::vector<std::string> contents;

  private:
    std::size_t bytesLeft;
    bool isInPart = false;
};

/** What stands in the parts of a body that is known to be whole. */
std::vector<std::string> readContents(const std::string& boundary, const std::string& body) {
    const std::string delimiter = "\r\n--" + boundary;
    const std::string text = "\r\n" + body;
    std::vector<std::string> contents;
    for (std::size_t at = delimiter.size(); text.compare(at, 2, "\r\n") == 0;) {
        const std::size_t begin = text.find("\r\n\r\n", at) + 4;
        const std::size_t end = text.find(delimiter, begin);
        contents.push_back(text.substr(begin, end - begin));
        at = end + delimiter.size();
    }
    return contents;
}

std::string parse(const std::string& boundary, const std::string& body, Cut cut) {
    Transcript transcript(500);
    Gateway::MultipartParser parser(boundary, transcript);
    for (std::size_t at = 0; at < body.size();) {
        const std::size_t count = cut.next(body.size() - at);
        parser.feed(body.data() + at, count);
        at += count;
    }
    const bool isComplete = parser.finish();
    require(isComplete == parser.getError().empty(), "what is not complete has an error");
    require(!isComplete || transcript.contents == readContents(boundary, body),
            "parts hold what stands between the boundaries");
    return transcript.text + "\n" + parser.getError();
}

/** A closed pool lends no decoder: sound is turned into samples and never recognised. */
Gateway::DecoderPool& pool() {
    static auto* const made = [] {
        auto* const closed = new Gateway::DecoderPool(Gateway::SpeechModel(), 1);
        closed->close();
        return closed;
    }();
    return *made;
}

std::string answer(const Gateway::RequestHead& head, const std::string& boundary,
                   const std::string& body, Cut cut) {
    Gateway::RecognitionRequest request(head, boundary, pool(), MAX_BODY_BYTES);
    for (std::size_t at = 0; at < body.size();) {
        const std::size_t count = cut.next(body.size() - at);
        request.write(body.data() + at, count);
        at += count;
    }
    const Gateway::Answer answer = request.finish();
    require(!request.describe("").empty(), "a request can be logged");
    std::string text = std::to_string(answer.status) + " " + answer.body;
    for (const auto& [name, value] : answer.headers) {
        text += name + ": " + (name == "x-kvrequestid" ? "any" : value) + "\n";
    }
    return text;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Fuzz::Input input(data, size);
    const uint32_t seed = 2U + input.takeByte();
    Gateway::RequestHead head;
    head.method = "POST";
    head.path = "/asrgw";
    head.uuid = "u1";
    head.contentType = input.takeLine();
    const std::string body = input.takeRest();
    std::string boundary;
    if (!Gateway::RecognitionRequest::checkHead(head, boundary).empty()) {
        return 0;
    }
    require(!boundary.empty() && boundary.size() <= 70, "a boundary has 1 to 70 characters");
    const std::string parsed = parse(boundary, body, Cut(0));
    const std::string answered = answer(head, boundary, body, Cut(0));
    for (const uint32_t start : {uint32_t{1}, seed}) {
        require(parse(boundary, body, Cut(start)) == parsed, "pieces do not change the parts");
        require(answer(head, boundary, body, Cut(start)) == answered,
                "pieces do not change the answer");
    }
    return 0;
}
