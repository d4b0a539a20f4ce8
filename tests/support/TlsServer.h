/**
 * @file
 * A TLS server that answers each request with a page, and certificates for it.
 */
#pragma once

#include <memory>
#include <string>

#include "support/ChildProcess.h"

namespace TestSupport {

/** Serves HTTPS on 127.0.0.1 until it is destroyed. */
class TlsServer {
  public:
    /**
     * Returns when the server listens.
     * @param base names certificate and key as `makeCertificate` does
     * @throws std::runtime_error if it does not start
     */
    explicit TlsServer(const std::string& base);

    /** "https://HOST:PORT/" */
    std::string getUrl(const std::string& host) const {
        return "https://" + host + ":" + port + "/";
    }

  private:
    ChildProcess program;
    std::string port;
};

/**
 * Makes a certificate, `base`.pem, that an authority has signed, and its key, `base`.key.
 * @param authority names certificate and key of the authority, as `makeCertificate` does
 * @param subject   the host that it names, such as "DNS:localhost"
 * @param days      for which it is valid; -1 for one that expired yesterday
 * @return what went wrong; empty after a success
 */
std::string makeSignedCertificate(const std::string& base, const std::string& authority,
                                  const std::string& subject, int days);

}  // namespace TestSupport
