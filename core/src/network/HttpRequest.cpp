#include "core/network/HttpRequest.h"

#include <algorithm>

#include "core/util/Ascii.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

bool hasControlCharacter(const std::string& text) {
    return std::any_of(text.begin(), text.end(), &Util::isControl);
}

bool isHeaderName(const std::string& name) {
    return !name.empty() && name.find_first_of(" :;") == std::string::npos &&
           !hasControlCharacter(name);
}

}  // namespace

boost::shared_ptr<HttpRequest> HttpRequest::create(const std::string& url,
                                                   const std::string& method, int timeoutMs,
                                                   bool followRedirects) {
    return boost::shared_ptr<HttpRequest>(new HttpRequest(url, method, timeoutMs, followRedirects));
}

HttpRequest::HttpRequest(std::string urlText, std::string methodText, int timeout, bool redirects)
    : url(std::move(urlText)),
      method(std::move(methodText)),
      timeoutMs(timeout),
      followRedirects(redirects) {}

void HttpRequest::addBoundaryHeader() {
    addHeader("Content-Type", "multipart/form-data; boundary=" + boundary);
}

void HttpRequest::setBody(const std::string& boundaryText, std::string content) {
    setBoundary(boundaryText);
    addBoundaryHeader();
    body = std::move(content);
}

void HttpRequest::refuse(const std::string& reason) {
    if (KOR_ASSERT(!reason.empty()) && refusal.empty()) {
        refusal = reason;
    }
}

void HttpRequest::addHeader(const std::string& name, const std::string& value) {
    if (!isHeaderName(name) || hasControlCharacter(value)) {
        kdLogMessage("HttpRequest: a header that is not well-formed was refused");
        return;
    }
    headers.emplace_back(name, value);
}

}  // namespace Network
