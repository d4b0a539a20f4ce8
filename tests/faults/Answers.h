/**
 * @file
 * Answers, byte for byte.
 */
#pragma once

#include <string>

#include "core/util/Base64Coder.h"
#include "support/ScriptedHttpServer.h"

namespace FaultTest {

/** The value of a results header that carries this document. */
inline std::string encode(const std::string& document) {
    return Util::Base64Coder::encode({document.begin(), document.end()});
}

/** "go forward", recognised without doubt. */
inline std::string encodedGoForward() {
    return encode(
        "<recognitionResults success=\"1\"><variant confidence=\"0.95\">go forward</variant>"
        "</recognitionResults>");
}

/** The whole answer with that result. */
inline std::string textOfGoForward(const std::string& body = "",
                                   const std::string& status = "200 OK") {
    return "HTTP/1.1 " + status + "\r\nx-asrgw-recognition-results: " + encodedGoForward() +
           "\r\nx-kvrequestid: request-1\r\nContent-Length: " + std::to_string(body.size()) +
           "\r\n\r\n" + body;
}

}  // namespace FaultTest
