#include "ReachChecks.h"

#include <arpa/inet.h>

#include <cerrno>
#include <cstring>

#include "Certificate.h"
#include "HttpProbe.h"
#include "ProbeText.h"

namespace Cli {

namespace {

const long DAYS_LEFT_MIN = 7;

/** Results of the verification of a certificate, as OpenSSL numbers them. */
enum VerifyResult {
    NOT_YET_VALID = 9,
    HAS_EXPIRED = 10,
    SELF_SIGNED = 18,
    SELF_SIGNED_IN_CHAIN = 19,
    NO_ISSUER = 20,
    NO_FIRST_ISSUER = 21,
};

/** The parts of an address that the network layer accepts. */
struct AddressParts {
    explicit AddressParts(const std::string& url) {
        CURLU* const parts = curl_url();
        curl_url_set(parts, CURLUPART_URL, url.c_str(), 0);
        host = get(parts, CURLUPART_HOST);
        port = get(parts, CURLUPART_PORT);
        plainUrl = "http://" + host + ":" + port;
        isSecure = get(parts, CURLUPART_SCHEME) == "https";
        curl_url_cleanup(parts);
        if (host.size() > 1 && host.front() == '[') {
            host = host.substr(1, host.size() - 2);
        }
    }

    bool isNumeric() const {
        in6_addr address = {};
        return inet_pton(AF_INET, host.c_str(), &address) == 1 ||
               inet_pton(AF_INET6, host.c_str(), &address) == 1;
    }

    std::string host;
    std::string port;
    std::string plainUrl; /**< the same host and port without TLS */
    bool isSecure = false;

  private:
    static std::string get(CURLU* parts, CURLUPart part) {
        char* text = nullptr;
        if (curl_url_get(parts, part, &text, CURLU_DEFAULT_PORT) != CURLUE_OK) {
            return "";
        }
        std::string result = text;
        curl_free(text);
        return result;
    }
};

Check checkName(const AddressParts& address, const ProbeResult& result, int timeoutMs) {
    if (address.isNumeric()) {
        return {"name", Check::WELL, address.host + " is an address, no name to look up"};
    }
    if (result.code == CURLE_COULDNT_RESOLVE_HOST) {
        return {"name", Check::PROBLEM, "the name " + address.host + " is not known here",
                "check its spelling and the name servers of this machine"};
    }
    if (result.isTimeout && result.nameMs == 0) {
        return {"name", Check::PROBLEM,
                "the name servers did not answer within " + secondsText(timeoutMs),
                "check the name servers of this machine"};
    }
    Check check("name", Check::WELL, address.host + " is " + result.ip);
    check.ms = result.nameMs;
    return check;
}

Check checkConnection(const AddressParts& address, const ProbeResult& result, int timeoutMs) {
    const std::string ip = result.ip.empty() ? address.host : result.ip;
    const std::string place = ip + " port " + address.port;
    if (result.isConnected) {
        Check check("connection", Check::WELL, place + " accepts connections");
        check.ms = result.connectMs;
        return check;
    }
    if (result.systemError == ECONNREFUSED) {
        return {"connection", Check::PROBLEM, place + " refuses connections",
                "check whether the gateway runs, and the port"};
    }
    if (result.isTimeout) {
        return {"connection", Check::PROBLEM,
                place + " did not accept the connection within " + secondsText(timeoutMs),
                "check the firewalls between here and there"};
    }
    const std::string reason =
        result.systemError == 0 ? result.error : std::strerror(result.systemError);
    return {"connection", Check::PROBLEM, "no connection to " + place + ": " + reason};
}

/** Describes a certificate that was refused, read over a connection that carries nothing else. */
Certificate readRefused(const ProbeTarget& target) {
    HttpProbe probe(target);
    probe.connect(false);
    return Certificate::read(probe.readCertificate());
}

Check explainRefusal(const AddressParts& address, const ProbeResult& result,
                     const Certificate& certificate) {
    switch (result.verifyResult) {
        case SELF_SIGNED:
        case SELF_SIGNED_IN_CHAIN:
        case NO_ISSUER:
        case NO_FIRST_ISSUER:
            return {"tls", Check::PROBLEM,
                    "the certificate is signed by an authority unknown here, see --ca-file; its "
                    "issuer is " +
                        certificate.issuer,
                    "name the authority's file with --ca-file, in the application with "
                    "setCertificateFile, or let the server send the whole chain"};
        case HAS_EXPIRED:
            return {"tls", Check::PROBLEM, "the certificate expired on " + certificate.expires,
                    "renew the certificate"};
        case NOT_YET_VALID:
            return {"tls", Check::PROBLEM, "the certificate is not valid yet",
                    "check the clocks of this machine and of the one that made the certificate"};
        default:
            break;
    }
    if (result.code == CURLE_PEER_FAILED_VERIFICATION && !certificate.issuer.empty()) {
        return {"tls", Check::PROBLEM,
                "the certificate does not name " + address.host + "; it names " +
                    (certificate.names.empty() ? "no host" : certificate.names),
                "use a name that the certificate has, or a certificate that has the name"};
    }
    return {"tls", Check::PROBLEM, "TLS failed: " + result.error,
            "check that the port speaks TLS 1.2 or later"};
}

Check checkTls(const AddressParts& address, const ProbeTarget& target) {
    if (!address.isSecure) {
        return {"tls", Check::SKIPPED, "not used: sound and identifiers travel in clear text"};
    }
    HttpProbe probe(target);
    const ProbeResult result = probe.connect(true);
    if (result.isTimeout) {
        return {"tls", Check::PROBLEM,
                "the server did not finish the handshake within " + secondsText(target.timeoutMs),
                "check that the port speaks TLS"};
    }
    if (result.code != CURLE_OK) {
        return explainRefusal(address, result, readRefused(target));
    }
    const Certificate certificate = Certificate::read(probe.readCertificate());
    const std::string days = daysText(certificate.daysLeft);
    Check check(
        "tls", Check::WELL,
        "issued by " + certificate.issuer + ", " + days + " left, names " + certificate.names);
    if (certificate.hasExpiry && certificate.daysLeft < DAYS_LEFT_MIN) {
        check =
            Check("tls", Check::PROBLEM,
                  "the certificate is valid for " + days + " only, until " + certificate.expires,
                  "renew the certificate");
    }
    check.ms = result.tlsMs;
    check.figures.emplace_back("daysLeft", static_cast<double>(certificate.daysLeft));
    return check;
}

}  // namespace

std::vector<Check> checkReach(const ProbeTarget& target) {
    const AddressParts address(target.url);
    // Without TLS first: libcurl does not tell a failed handshake from a failed connection.
    ProbeTarget plain = target;
    plain.url = address.plainUrl;
    const ProbeResult result = HttpProbe(plain).connect(true);
    std::vector<Check> checks = {checkName(address, result, target.timeoutMs)};
    if (checks.back().verdict == Check::WELL) {
        checks.push_back(checkConnection(address, result, target.timeoutMs));
    }
    if (checks.back().verdict == Check::WELL) {
        checks.push_back(checkTls(address, target));
    }
    return checks;
}

}  // namespace Cli
