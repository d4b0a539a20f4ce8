#include <string>

#include "support/ScriptedHttpServer.h"

namespace TestSupport {

Answer Answer::status(int code, const Headers& headers, const std::string& body) {
    std::string text = "HTTP/1.1 " + std::to_string(code) + " Scripted\r\n";
    for (const auto& header : headers) {
        text += header.first + ": " + header.second + "\r\n";
    }
    text += "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
    return raw(text);
}

Answer Answer::raw(const std::string& bytes) {
    Answer answer;
    answer.pieces.push_back(bytes);
    return answer;
}

Answer Answer::never() {
    return Answer();
}

Answer Answer::closing() {
    return Answer().thenClose();
}

Answer Answer::resetAfter(std::size_t bodyBytes) {
    return Answer().afterBodyBytes(bodyBytes).thenReset();
}

Answer Answer::onHead() const {
    return afterBodyBytes(0);
}

Answer Answer::afterBodyBytes(std::size_t count) const {
    Answer copy = *this;
    copy.actAfter = count;
    return copy;
}

Answer Answer::notReading() const {
    Answer copy = *this;
    copy.pauseReading = true;
    return copy;
}

Answer Answer::thenClose() const {
    Answer copy = *this;
    copy.end = End::CLOSE;
    return copy;
}

Answer Answer::thenReset() const {
    Answer copy = *this;
    copy.end = End::RESET;
    return copy;
}

Answer Answer::held() const {
    Answer copy = *this;
    copy.needsRelease = true;
    return copy;
}

Answer Answer::inPieces(std::size_t size) const {
    Answer copy = *this;
    copy.needsRelease = true;
    copy.pieces.clear();
    for (const std::string& piece : pieces) {
        for (std::size_t offset = 0; offset < piece.size(); offset += size) {
            copy.pieces.push_back(piece.substr(offset, size));
        }
    }
    return copy;
}

Answer Answer::readingInPieces(std::size_t size) const {
    Answer copy = *this;
    copy.readAtOnce = size;
    return copy;
}

}  // namespace TestSupport
