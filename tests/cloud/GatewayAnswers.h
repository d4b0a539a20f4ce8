/**
 * @file
 * What the recognition service answers.
 */
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "core/util/Base64Coder.h"
#include "support/ScriptedHttpServer.h"

namespace CloudTest {

/** An answer whose results header carries `document`. */
inline TestSupport::Answer answerDocument(const std::string& document,
                                          const std::string& requestId = "request-1") {
    return TestSupport::Answer::status(
        200, {{"x-asrgw-recognition-results",
               Util::Base64Coder::encode({document.begin(), document.end()})},
              {"x-kvrequestid", requestId}});
}

/** A result document with these texts and confidences. */
inline std::string makeDocument(
    const std::vector<std::pair<std::string, std::string>>& textsAndConfidences) {
    std::string document =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults success=\"1\">";
    for (const auto& variant : textsAndConfidences) {
        document +=
            "<variant confidence=\"" + variant.second + "\">" + variant.first + "</variant>";
    }
    return document + "</recognitionResults>";
}

/** "go forward", recognised without doubt. */
inline TestSupport::Answer answerGoForward() {
    return answerDocument(makeDocument({{"go forward", "0.95"}, {"go for it", "0.5"}}));
}

}  // namespace CloudTest
