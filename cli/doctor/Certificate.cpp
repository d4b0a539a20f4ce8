#include "Certificate.h"

#include <curl/curl.h>

#include <cmath>

#include "pal/kd_time.h"

namespace Cli {

namespace {

const double DAY_S = 24.0 * 60 * 60;

std::string find(const std::map<std::string, std::string>& fields, const std::string& name) {
    const auto found = fields.find(name);
    return found == fields.end() ? "" : found->second;
}

void removeAll(std::string& text, const std::string& part) {
    for (std::size_t at = text.find(part); at != std::string::npos; at = text.find(part, at)) {
        text.erase(at, part.size());
    }
}

}  // namespace

Certificate Certificate::read(const std::map<std::string, std::string>& fields) {
    Certificate certificate;
    certificate.issuer = find(fields, "Issuer");
    certificate.names = find(fields, "X509v3 Subject Alternative Name");
    removeAll(certificate.names, "DNS:");
    removeAll(certificate.names, "IP Address:");
    certificate.expires = find(fields, "Expire date");
    const time_t expiry = curl_getdate(certificate.expires.c_str(), nullptr);
    certificate.hasExpiry = expiry != -1;
    if (certificate.hasExpiry) {
        certificate.daysLeft =
            static_cast<long>(std::floor(static_cast<double>(expiry - kdTime(nullptr)) / DAY_S));
    }
    return certificate;
}

}  // namespace Cli
