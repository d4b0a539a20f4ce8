#include "support/TlsServer.h"

#include <fstream>
#include <stdexcept>

namespace TestSupport {

TlsServer::TlsServer(const std::string& base)
    : program({"openssl", "s_server", "-accept", "127.0.0.1:0", "-www", "-cert", base + ".pem",
               "-key", base + ".key"}) {
    const std::string mark = "ACCEPT 127.0.0.1:";
    std::string output;
    std::size_t start = std::string::npos;
    while (start == std::string::npos || output.find('\n', start) == std::string::npos) {
        const std::string piece = program.read();
        if (piece.empty()) {
            throw std::runtime_error("openssl: " + output);
        }
        output += piece;
        start = output.find(mark);
    }
    start += mark.size();
    port = output.substr(start, output.find('\n', start) - start);
}

std::string makeSignedCertificate(const std::string& base, const std::string& authority,
                                  const std::string& subject, int days) {
    std::ofstream(base + ".ext") << "subjectAltName=" << subject << "\n";
    const ChildProcess::Result asked = ChildProcess::run(
        {"openssl", "req", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:prime256v1", "-nodes",
         "-subj", "/CN=talvox server", "-keyout", base + ".key", "-out", base + ".csr"});
    const ChildProcess::Result made = ChildProcess::run(
        {"openssl", "x509", "-req", "-in", base + ".csr", "-CA", authority + ".pem", "-CAkey",
         authority + ".key", "-CAcreateserial", "-days", std::to_string(days), "-extfile",
         base + ".ext", "-out", base + ".pem"});
    return asked.exitStatus == 0 && made.exitStatus == 0 ? ""
                                                         : "openssl: " + asked.output + made.output;
}

}  // namespace TestSupport
