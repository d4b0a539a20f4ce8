#include "network/curl/ResponseHead.h"

#include <boost/make_shared.hpp>

namespace Network {

namespace {

// libcurl bounds a head as well, but only since late versions.
constexpr std::size_t MOST_BYTES = std::size_t{256} * 1024;

}  // namespace

bool ResponseHead::hasRoom(std::size_t size) const {
    return size <= MOST_BYTES - bytes;
}

bool ResponseHead::addLine(std::string_view line) {
    bytes += line.size();
    const std::string_view text = line.substr(0, line.find_last_not_of("\r\n") + 1);
    if (text.empty()) {
        return true;
    }
    if (text.compare(0, 5, "HTTP/") == 0) {
        fields.clear();  // an interim answer or a redirect came before
        return false;
    }
    const std::size_t colon = text.find(':');
    if (text.front() == ' ' || text.front() == '\t') {
        if (!fields.empty()) {
            fields.back().second += text;
        }
    } else if (colon != std::string::npos) {
        fields.emplace_back(text.substr(0, colon), text.substr(colon + 1));
    }
    return false;
}

bool ResponseHead::has(const std::string& name) const {
    return makeResponse(0)->getHeader(name).has_value();
}

boost::shared_ptr<HttpResponse> ResponseHead::makeResponse(int status) const {
    auto response = boost::make_shared<HttpResponse>(status);
    for (const auto& field : fields) {
        response->addHeader(field.first, field.second);
    }
    return response;
}

}  // namespace Network
