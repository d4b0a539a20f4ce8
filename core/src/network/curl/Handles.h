#pragma once

#include <curl/curl.h>

#include <memory>
#include <string>

#include "network/curl/CertificateFile.h"
#include "network/curl/OpenSockets.h"
#include "network/curl/PlatformAuthorities.h"

namespace Network {

/** A libcurl handle and the file of private authorities that it was made for; "" for none. */
struct Handle {
    struct Deleter {
        void operator()(CURL* owned) const { curl_easy_cleanup(owned); }
    };

    std::unique_ptr<CURL, Deleter> easy;
    std::string certificateFile;
};

/**
 * Makes the handles of the transfers, and keeps one that is idle: a new handle costs as much as the
 * rest of a small request. What every request has the same is set when a handle is made. Network
 * thread only; must outlive the connections.
 */
class Handles {
  public:
    Handles() = default;
    Handles(const Handles&) = delete;
    Handles& operator=(const Handles&) = delete;

    /**
     * A handle for a request that trusts these authorities beside the platform's. What differs from
     * request to request is as the last one left it.
     * @return without a handle if memory is short
     */
    Handle take(const std::string& certificateFile);

    /** Keeps a handle for the next request, if that may trust the same authorities. */
    void giveBack(Handle handle);

    /** Takes note of how a request ended. */
    void noteEnd(CURLcode result);

    OpenSockets& getSockets() { return sockets; }

  private:
    bool setUp(const Handle& handle);
    bool setAuthorities(const Handle& handle);

    static constexpr long AUTHORITY_CACHE_S = 24L * 60 * 60;

    OpenSockets sockets;
    PlatformAuthorities authorities;
    CertificateFile privateAuthorities;
    Handle spare;
    bool hasFailedTls = false;
};

}  // namespace Network
