#include "network/FailureText.h"

#include <algorithm>

namespace Network {

namespace {

constexpr std::size_t MOST_BYTES = 200;
constexpr int SERVICE_UNAVAILABLE = 503;

bool isUnprintable(char c) {
    return c < 0x20 || c > 0x7E;
}

}  // namespace

std::string makeReason(const std::string& text) {
    std::string reason = text.substr(0, MOST_BYTES);
    std::replace_if(reason.begin(), reason.end(), &isUnprintable, '?');
    return reason;
}

std::string describeStatus(const HttpResponse& response) {
    const int status = response.getStatus();
    if (status >= 200 && status < 300) {
        return {};
    }
    // Without the header the service does not expect to be back soon.
    const bool isBusy =
        status == SERVICE_UNAVAILABLE && response.getHeader("Retry-After").has_value();
    return "HTTP status " + std::to_string(status) + (isBusy ? " (the service is busy)" : "");
}

std::string describeTimeout(int timeoutMs) {
    return timeoutMs % 1000 == 0 ? "no answer for " + std::to_string(timeoutMs / 1000) + " s"
                                 : "no answer for " + std::to_string(timeoutMs) + " ms";
}

}  // namespace Network
