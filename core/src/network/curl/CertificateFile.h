#pragma once

#include <curl/curl.h>

#include <string>

namespace Network {

/**
 * The application's file with authorities that connections trust beside those of the platform. It
 * is read once and kept until another file is set. Network thread only.
 */
class CertificateFile {
  public:
    /**
     * Sets up a handle so that the connections of its next request trust these authorities. If
     * there is nothing to trust in the file, they fail.
     * @param path empty for no file
     * @param retry read the file again; what was read stays if that fails
     * @return false if memory is short
     */
    bool attach(CURL* handle, const std::string& path, bool retry);

    /** What the file holds; empty for no file and for one that cannot be read. */
    const std::string& getText() const { return text; }

  private:
    void read();

    std::string path;
    std::string text;
};

}  // namespace Network
