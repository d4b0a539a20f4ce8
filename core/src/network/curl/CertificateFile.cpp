#include "network/curl/CertificateFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "pal/kd_log.h"

namespace Network {

namespace {

// Some ten times the authorities of a system.
constexpr off_t MOST_BYTES = off_t{4} * 1024 * 1024;

/** Closes the file at the end of its life. */
class OpenFile {
  public:
    // The network thread must not wait for the other end of a pipe.
    explicit OpenFile(const std::string& path)
        : file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)) {}
    ~OpenFile() {
        if (file >= 0) {
            ::close(file);
        }
    }
    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    /** @return why there are no bytes; null after a success */
    const char* read(std::string& bytes) const {
        struct stat status = {};
        if (file < 0 || ::fstat(file, &status) != 0) {
            return std::strerror(errno);
        }
        if (!S_ISREG(status.st_mode)) {
            return "it is no regular file";
        }
        if (status.st_size > MOST_BYTES) {
            return "it is too large";
        }
        bytes.resize(static_cast<std::size_t>(status.st_size));
        const ssize_t count = ::read(file, bytes.data(), bytes.size());
        if (count < 0) {
            return std::strerror(errno);
        }
        bytes.resize(static_cast<std::size_t>(count));
        return bytes.empty() ? "it is empty" : nullptr;
    }

  private:
    const int file;
};

}  // namespace

bool CertificateFile::attach(CURL* handle, const std::string& wanted, bool retry) {
    if (wanted != path) {
        text.clear();
        path = wanted;
    }
    if (path.empty()) {
        return curl_easy_setopt(handle, CURLOPT_CAINFO_BLOB, nullptr) != CURLE_OUT_OF_MEMORY;
    }
    if (text.empty() || retry) {
        read();
    }
    // It takes the place of libcurl's default file; the default folder stays. libcurl finds no
    // certificate in no text, and lets the connection fail. It compares the bytes when it looks for
    // a connection to use again: one that other authorities vouched for does not serve.
    curl_blob blob = {text.data(), text.size(), CURL_BLOB_COPY};
    return curl_easy_setopt(handle, CURLOPT_CAINFO_BLOB, &blob) == CURLE_OK;
}

void CertificateFile::read() {
    std::string bytes;
    const char* const fault = OpenFile(path).read(bytes);
    if (fault == nullptr) {
        text.swap(bytes);
    } else {
        kdLogFormatMessage("Network: the certificate file %s cannot be read: %s", path.c_str(),
                           fault);
    }
}

}  // namespace Network
