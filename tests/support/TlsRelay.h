/**
 * @file
 * A TLS server with a certificate of its own in front of a server that speaks plain HTTP.
 */
#pragma once

#include <memory>
#include <string>

#include "support/ChildProcess.h"

namespace TestSupport {

/**
 * Makes a self-signed certificate, `base`.pem, and its key, `base`.key.
 * @param subject the host that it names, such as "IP:127.0.0.1"
 * @return what went wrong; empty after a success
 */
std::string makeCertificate(const std::string& base, const std::string& subject);

/** Accepts TLS connections on the loopback interface and relays what they carry. */
class TlsRelay {
  public:
    /** Whether the programs that this needs are installed. */
    static bool isAvailable();

    /**
     * Returns when the relay listens.
     * @param base       names certificate and key as `makeCertificate` does
     * @param targetPort of the server behind it, on the loopback interface
     * @throws std::runtime_error if it does not start
     */
    TlsRelay(const std::string& base, unsigned short targetPort);

    /** "https://127.0.0.1:PORT" */
    std::string getUrl() const { return "https://127.0.0.1:" + port; }

  private:
    ChildProcess program;
    std::string port;
};

}  // namespace TestSupport
