#include "CertificateFile.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <vector>

#include "Text.h"
#include "UsageError.h"
#include "core/network/NetworkManager.h"
#include "core/util/Base64Coder.h"

namespace Cli {

namespace {

// Some ten times the authorities of a system; a device that never ends must not fill the memory.
const std::size_t FILE_MAX_BYTES = std::size_t{4} * 1024 * 1024;

[[noreturn]] void refuse(const std::string& path, const std::string& reason) {
    throw UsageError("cannot use the certificate file " + printable(path) + ": " + reason);
}

std::string readFile(const std::string& path) {
    struct stat status = {};
    if (stat(path.c_str(), &status) != 0) {
        refuse(path, std::strerror(errno));
    }
    if (S_ISDIR(status.st_mode)) {
        refuse(path, "it is a directory");
    }
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        refuse(path, std::strerror(errno));
    }
    std::string bytes(FILE_MAX_BYTES, '\0');
    file.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    bytes.resize(static_cast<std::size_t>(file.gcount()));
    return bytes;
}

/** Whether a certificate in base64 stands between a begin line and an end line of this label. */
bool holdsCertificate(const std::string& text, const std::string& label) {
    const std::string begin = "-----BEGIN " + label + "-----";
    const std::string end = "-----END " + label + "-----";
    for (std::size_t at = text.find(begin); at != std::string::npos; at = text.find(begin, at)) {
        at += begin.size();
        std::string body = text.substr(at, std::min(text.find(end, at), text.size()) - at);
        body.erase(std::remove_if(body.begin(), body.end(),
                                  [](char c) { return c == '\n' || c == '\r' || c == ' '; }),
                   body.end());
        std::vector<unsigned char> bytes;
        if (Util::Base64Coder::decode(body, bytes) && !bytes.empty()) {
            return true;
        }
    }
    return false;
}

}  // namespace

void trustAuthoritiesOf(const std::string& path) {
    const std::string text = readFile(path);
    const std::string labels[] = {"CERTIFICATE", "X509 CERTIFICATE", "TRUSTED CERTIFICATE"};
    if (std::none_of(std::begin(labels), std::end(labels),
                     [&text](const std::string& label) { return holdsCertificate(text, label); })) {
        refuse(path, "it holds no certificate in PEM form");
    }
    Network::NetworkManager::getInstance().setCertificateFile(path);
}

}  // namespace Cli
