#include "core/network/HttpRequest.h"

namespace Network {

namespace {

const char* const CRLF = "\r\n";

std::string quoteName(const std::string& name) {
    std::string quoted;
    for (const char c : name) {
        switch (c) {
            case '"':
                quoted += "%22";
                break;
            case '\r':
                quoted += "%0D";
                break;
            case '\n':
                quoted += "%0A";
                break;
            default:
                quoted += c;
        }
    }
    return quoted;
}

}  // namespace

boost::shared_ptr<HttpRequest::MultipartBuilder> HttpRequest::MultipartBuilder::create(
    const std::string& boundary) {
    return boost::shared_ptr<MultipartBuilder>(new MultipartBuilder(boundary));
}

HttpRequest::MultipartBuilder::MultipartBuilder(std::string boundaryText)
    : boundary(std::move(boundaryText)) {}

void HttpRequest::MultipartBuilder::addField(const std::string& name, const std::string& value,
                                             bool asFile, bool base64,
                                             const std::string& contentType) {
    content += startField(name, asFile, base64, contentType);
    content += value;
    content += endField();
}

std::string HttpRequest::MultipartBuilder::startField(const std::string& name, bool asFile,
                                                      bool base64,
                                                      const std::string& contentType) const {
    const std::string quoted = quoteName(name);
    std::string text = "--" + boundary + CRLF;
    text += "Content-Disposition: form-data; name=\"" + quoted + "\"";
    if (asFile) {
        text += "; filename=\"" + quoted + "\"";
    }
    text += CRLF;
    if (!contentType.empty()) {
        text += "Content-Type: " + contentType + CRLF;
    }
    if (base64) {
        text += std::string("Content-Transfer-Encoding: base64") + CRLF;
    }
    return text + CRLF;
}

std::string HttpRequest::MultipartBuilder::endField() const {
    return CRLF;
}

std::string HttpRequest::MultipartBuilder::endEncodedContent() const {
    return "--" + boundary + "--" + CRLF;
}

std::string HttpRequest::MultipartBuilder::getEncodedContent() const {
    return content + endEncodedContent();
}

}  // namespace Network
