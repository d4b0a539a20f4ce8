#include <mbedtls/ssl.h>
#include <mbedtls/x509_crt.h>

#include <map>
#include <memory>

#include "network/curl/PlatformAuthorities.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

// In the order of preference. The platform itself uses the first that has any certificates; an
// authority that an update removed from it must not come back through the second.
constexpr const char* FOLDERS[] = {TALVOX_AUTHORITY_FOLDERS};

/**
 * Certificates as mbed TLS chains them. The address of the first stays while there are others in
 * its place: configurations of connections refer to it.
 */
class Chain {
  public:
    Chain() { mbedtls_x509_crt_init(&first); }
    ~Chain() { clear(); }
    Chain(const Chain&) = delete;
    Chain& operator=(const Chain&) = delete;

    bool isEmpty() const { return first.version == 0; }
    mbedtls_x509_crt* get() { return &first; }

    void clear() {
        if (last != nullptr) {
            last->next = nullptr;
            last = nullptr;
        }
        mbedtls_x509_crt_free(&first);
    }

    /** Continues this chain with another, which must outlive it. */
    void append(Chain& other) {
        last = &first;
        while (last->next != nullptr) {
            last = last->next;
        }
        last->next = other.get();
    }

  private:
    mbedtls_x509_crt first = {};
    mbedtls_x509_crt* last = nullptr;  // of its own, if another chain follows
};

/** The application's authorities, with those of the platform behind them. */
struct Others {
    Chain chain;
    bool isWhole = false;

    /** Memory may have been short before. */
    void read(const std::string& text, Chain& platform) {
        chain.clear();
        const auto* const bytes = reinterpret_cast<const unsigned char*>(text.c_str());
        isWhole = mbedtls_x509_crt_parse(chain.get(), bytes, text.size() + 1) == 0;
        chain.append(platform);
    }
};

}  // namespace

struct PlatformAuthorities::Store {
    void read() {
        platform.clear();
        for (const char* const folder : FOLDERS) {
            const int result = mbedtls_x509_crt_parse_path(platform.get(), folder);
            unread = result > 0 ? result : 0;
            if (unread > 0) {
                kdLogFormatMessage("Network: %d files of %s are not readable as certificates",
                                   unread, folder);
            }
            if (!platform.isEmpty()) {
                return;
            }
        }
        kdLogMessage("Network: the platform has no certificates of authorities");
    }

    /** Memory may have been short. If the same number fails again, the files themselves are bad. */
    void readAgain() {
        const int unreadBefore = unread;
        read();
        isFinal = unread == unreadBefore;
    }

    /** What a connection trusts. */
    Chain& find(const std::string& text, bool retry) {
        if (text.empty()) {
            return platform;
        }
        const auto found = others.find(text);
        if (found != others.end() && (found->second.isWhole || !retry)) {
            return found->second.chain;
        }
        Others& read = others[text];
        read.read(text, platform);
        return read.chain;
    }

    static CURLcode onTlsConfiguration(CURL*, void* configuration, void* chain) {
        mbedtls_ssl_conf_ca_chain(static_cast<mbedtls_ssl_config*>(configuration),
                                  static_cast<Chain*>(chain)->get(), nullptr);
        return CURLE_OK;
    }

    Chain platform;
    // By text. All are kept, since connections that are being opened may refer to them; an
    // application names few files.
    std::map<std::string, Others> others;
    int unread = 0;
    bool isFinal = false;
};

PlatformAuthorities::PlatformAuthorities() : store(std::make_unique<Store>()) {}
PlatformAuthorities::~PlatformAuthorities() = default;

bool PlatformAuthorities::attach(CURL* handle, const std::string& others, bool retry) {
    if (store->platform.isEmpty()) {
        store->read();
    } else if (retry && store->unread > 0 && !store->isFinal) {
        store->readAgain();
    }
    return curl_easy_setopt(handle, CURLOPT_SSL_CTX_FUNCTION, &Store::onTlsConfiguration) ==
               CURLE_OK &&
           curl_easy_setopt(handle, CURLOPT_SSL_CTX_DATA, &store->find(others, retry)) == CURLE_OK;
}

}  // namespace Network
