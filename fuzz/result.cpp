/* The service's answer: a header in base64, or the document inside it. */
#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <cmath>
#include <string>
#include <vector>

#include "Fuzz.h"
#include "core/network/HttpResponse.h"
#include "core/util/Base64Coder.h"
#include "talvox/Recognition.h"
#include "talvox/Settings.h"
#include "talvox/impl/RecognizeRequest.h"
#include "talvox/impl/RequestFormat.h"
#include "talvox/impl/ResultDocument.h"

namespace {

using Fuzz::require;
using Talvox::Recognition;
using Util::Base64Coder;

const char* const HEADER = "X-ASRGW-Recognition-Results";
const char* const IDENTIFIER = "abc";

/** The length of the character of UTF-8 that stands at `at`; 0 where there is none. */
std::size_t lengthOfCharacter(const std::string& text, std::size_t at) {
    const auto byteAt = [&text](std::size_t index) {
        return index < text.size() ? static_cast<unsigned char>(text[index]) : 0U;
    };
    const unsigned lead = byteAt(at);
    if (lead < 0x80) {
        return 1;
    }
    const std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    unsigned code = lead & (0xFFU >> (length + 1));
    for (std::size_t i = 1; i < length; ++i) {
        if ((byteAt(at + i) & 0xC0U) != 0x80) {
            return 0;
        }
        code = code << 6U | (byteAt(at + i) & 0x3FU);
    }
    const unsigned least = length == 4 ? 0x10000 : length == 3 ? 0x800 : 0x80;
    const bool isSurrogate = code >= 0xD800 && code <= 0xDFFF;
    return lead >= 0xC0 && code >= least && code <= 0x10FFFF && !isSurrogate ? length : 0;
}

void requireUtf8(const std::string& text) {
    for (std::size_t at = 0; at < text.size();) {
        const std::size_t length = lengthOfCharacter(text, at);
        require(length > 0, "a hypothesis is UTF-8");
        at += length;
    }
}

void requireUsable(const Talvox::RecognitionResults& results) {
    static const Talvox::Settings settings;
    for (const Talvox::RecognitionResult& result : results) {
        require(!result.getText().empty(), "a hypothesis has a text");
        requireUtf8(result.getText());
        require(std::isfinite(result.getConfidence()), "a confidence is a number");
    }
    const Recognition::Outcome outcome = Recognition::decideOutcome(results, settings);
    require(outcome >= Recognition::OutcomeRejected && outcome <= Recognition::OutcomeUncertain,
            "there is a verdict");
    require(!makeTranscripts(results, {"korvel", "", ""}).empty(), "results can be uploaded");
}

std::vector<unsigned char> toBytes(const std::string& text) {
    return {text.begin(), text.end()};
}

/** A request takes the results over from the response, or none and no identifier either. */
void requireTaken(const Network::HttpResponse& response,
                  const boost::shared_ptr<Talvox::RecognitionResults>& results) {
    static const Talvox::Settings settings;
    Talvox::RecognizeRequest request(settings, settings);
    request.onResponseRecieved(boost::make_shared<Network::HttpResponse>(response));
    require(request.resultsReceived == static_cast<bool>(results), "results are received");
    require(request.requestId == (results ? IDENTIFIER : ""), "the identifier comes with results");
    if (results) {
        requireUsable(*results);
        require(std::equal(results->begin(), results->end(), request.results->begin(),
                           request.results->end(),
                           [](const auto& left, const auto& right) {
                               return left.getText() == right.getText() &&
                                      left.getConfidence() == right.getConfidence();
                           }),
                "the same header gives the same results");
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    const std::string input = Fuzz::Input(data, size).takeRest();
    const bool isDocument = !input.empty() && input.front() == '<';
    std::vector<unsigned char> bytes;
    if (isDocument) {
        require(Base64Coder::decode(Base64Coder::encode(toBytes(input)), bytes) &&
                    bytes == toBytes(input),
                "base64 gives back what went in");
    }
    Network::HttpResponse response(200);
    response.addHeader(HEADER, isDocument ? Base64Coder::encode(toBytes(input)) : input);
    response.addHeader("x-kvrequestid", IDENTIFIER);
    const std::string header = response.getHeader(HEADER).value_or("none");
    if (Base64Coder::decode(header, bytes)) {
        require(Base64Coder::encode(bytes) == header, "bytes have one base64 only");
    } else {
        require(bytes.empty(), "bad base64 gives no bytes");
    }
    requireTaken(response, Talvox::parseResultHeader(header));
    return 0;
}
