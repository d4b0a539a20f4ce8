#include "core/network/HttpResponse.h"

#include "core/util/Ascii.h"

namespace Network {

namespace {

std::string trim(const std::string& text) {
    const char* const blanks = " \t\r\n";
    const std::size_t first = text.find_first_not_of(blanks);
    if (first == std::string::npos) {
        return std::string();
    }
    return text.substr(first, text.find_last_not_of(blanks) - first + 1);
}

}  // namespace

HttpResponse::HttpResponse(int statusCode) : status(statusCode) {}

int HttpResponse::getStatus() const {
    return status;
}

std::optional<std::string> HttpResponse::getHeader(const std::string& name) const {
    const auto found = headers.find(Util::toLower(name));
    if (found == headers.end()) {
        return std::nullopt;
    }
    return found->second;
}

void HttpResponse::addHeader(const std::string& name, const std::string& value) {
    headers.emplace(Util::toLower(name), trim(value));
}

}  // namespace Network
