#include "network/RequestCheck.h"

#include <algorithm>

#include "pal/kd_log.h"

namespace Network {

namespace {

bool isBlankOrControl(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte <= 0x20 || byte == 0x7F;
}

bool startsWithNoCase(const std::string& text, const std::string& lower) {
    return text.size() >= lower.size() &&
           std::equal(lower.begin(), lower.end(), text.begin(), [](char wanted, char c) {
               return wanted == (c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c);
           });
}

const char* findFault(const HttpRequest& request) {
    const std::string& url = request.getUrl();
    if (std::any_of(url.begin(), url.end(), &isBlankOrControl)) {
        return "a blank or control character in its URL";
    }
    if (!startsWithNoCase(url, "http://") && !startsWithNoCase(url, "https://")) {
        return "its URL is neither http nor https";
    }
    if (request.getMethod() != "GET" && request.getMethod() != "POST") {
        return "its method is neither GET nor POST";
    }
    const bool hasBody = request.isChunked() || !request.getBody().empty();
    if (hasBody && request.getMethod() == "GET") {
        return "GET with a body";
    }
    if (request.isChunked() && !request.getWriter()) {
        return "nobody writes its body";
    }
    return nullptr;
}

}  // namespace

bool canBeSent(const boost::shared_ptr<HttpRequest>& request) {
    const char* const fault = request ? findFault(*request) : "there is none";
    if (fault != nullptr) {
        kdLogFormatMessage("Network: a request cannot be sent: %s", fault);
    }
    return fault == nullptr;
}

}  // namespace Network
