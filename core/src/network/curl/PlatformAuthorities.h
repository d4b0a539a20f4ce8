#pragma once

#include <curl/curl.h>

#include <memory>
#include <string>

namespace Network {

/**
 * The authorities of the platform, for a TLS library that does not know where they are: mbed TLS on
 * Android. They are read once and shared by all connections.
 *
 * With TALVOX_AUTHORITY_FOLDERS the implementation is FolderAuthorities.cpp, else
 * SystemAuthorities.cpp, which leaves libcurl's own default alone. Network thread only; must
 * outlive the connections.
 */
class PlatformAuthorities {
  public:
    PlatformAuthorities();
    ~PlatformAuthorities();
    PlatformAuthorities(const PlatformAuthorities&) = delete;
    PlatformAuthorities& operator=(const PlatformAuthorities&) = delete;

    /**
     * Sets up a handle so that the connections of its next request trust these authorities.
     * @param others certificates in PEM form of authorities to trust beside them; may be empty
     * @param retry read again if some certificates could not be read
     * @return false if libcurl refuses
     */
    bool attach(CURL* handle, const std::string& others, bool retry);

  private:
    struct Store;
    std::unique_ptr<Store> store;
};

}  // namespace Network
