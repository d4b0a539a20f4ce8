#include <mbedtls/ssl.h>
#include <mbedtls/x509_crt.h>

#include <memory>

#include "network/curl/PlatformAuthorities.h"
#include "pal/kd_log.h"

namespace Network {

namespace {

// In the order of preference. The platform itself uses the first that has any certificates; an
// authority that an update removed from it must not come back through the second.
constexpr const char* FOLDERS[] = {TALVOX_AUTHORITY_FOLDERS};

}  // namespace

struct PlatformAuthorities::Store {
    Store() { mbedtls_x509_crt_init(&chain); }
    ~Store() { mbedtls_x509_crt_free(&chain); }
    Store(const Store&) = delete;
    Store& operator=(const Store&) = delete;

    bool isEmpty() const { return chain.version == 0; }

    /** The address of the chain stays: configurations of connections refer to it. */
    void read() {
        mbedtls_x509_crt_free(&chain);
        for (const char* const folder : FOLDERS) {
            const int result = mbedtls_x509_crt_parse_path(&chain, folder);
            unread = result > 0 ? result : 0;
            if (unread > 0) {
                kdLogFormatMessage("Network: %d files of %s are not readable as certificates",
                                   unread, folder);
            }
            if (!isEmpty()) {
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

    static CURLcode onTlsConfiguration(CURL*, void* configuration, void* self) {
        mbedtls_ssl_conf_ca_chain(static_cast<mbedtls_ssl_config*>(configuration),
                                  &static_cast<Store*>(self)->chain, nullptr);
        return CURLE_OK;
    }

    mbedtls_x509_crt chain = {};
    int unread = 0;
    bool isFinal = false;
};

PlatformAuthorities::PlatformAuthorities() : store(std::make_unique<Store>()) {}
PlatformAuthorities::~PlatformAuthorities() = default;

bool PlatformAuthorities::attach(CURL* handle, bool retry) {
    if (store->isEmpty()) {
        store->read();
    } else if (retry && store->unread > 0 && !store->isFinal) {
        store->readAgain();
    }
    return curl_easy_setopt(handle, CURLOPT_SSL_CTX_FUNCTION, &Store::onTlsConfiguration) ==
               CURLE_OK &&
           curl_easy_setopt(handle, CURLOPT_SSL_CTX_DATA, store.get()) == CURLE_OK;
}

}  // namespace Network
