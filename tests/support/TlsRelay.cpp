#include "support/TlsRelay.h"

#include <stdexcept>

namespace TestSupport {

std::string makeCertificate(const std::string& base, const std::string& subject) {
    const ChildProcess::Result made = ChildProcess::run(
        {"openssl", "req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:prime256v1",
         "-nodes", "-days", "2", "-subj", "/CN=talvox test", "-addext", "subjectAltName=" + subject,
         "-keyout", base + ".key", "-out", base + ".pem"});
    return made.exitStatus == 0 ? "" : "openssl: " + made.output;
}

bool TlsRelay::isAvailable() {
    return ChildProcess::isInstalled("openssl") && ChildProcess::isInstalled("socat");
}

TlsRelay::TlsRelay(const std::string& base, unsigned short targetPort)
    : program({"socat", "-d", "-d",
               "OPENSSL-LISTEN:0,bind=127.0.0.1,fork,verify=0,cert=" + base + ".pem,key=" + base +
                   ".key",
               "TCP:127.0.0.1:" + std::to_string(targetPort)}) {
    const std::string mark = "listening on AF=2 127.0.0.1:";
    std::string output;
    std::size_t start = std::string::npos;
    while (start == std::string::npos || output.find('\n', start) == std::string::npos) {
        const std::string piece = program.read();
        if (piece.empty()) {
            throw std::runtime_error("socat: " + output);
        }
        output += piece;
        start = output.find(mark);
    }
    start += mark.size();
    port = output.substr(start, output.find('\n', start) - start);
}

}  // namespace TestSupport
