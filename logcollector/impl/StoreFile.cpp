#include "logcollector/impl/StoreFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <utility>

namespace LogCollector {

namespace {

constexpr mode_t FOR_THE_USER_ONLY = 0600;

}  // namespace

StoreFile::StoreFile(const std::string& path, int flags)
    : descriptor(::open(path.c_str(), flags | O_CLOEXEC | O_NOFOLLOW, FOR_THE_USER_ONLY)) {}

StoreFile::~StoreFile() {
    if (descriptor >= 0) {
        ::close(descriptor);
    }
}

StoreFile::StoreFile(StoreFile&& other) noexcept
    : descriptor(std::exchange(other.descriptor, -1)) {}

StoreFile& StoreFile::operator=(StoreFile&& other) noexcept {
    std::swap(descriptor, other.descriptor);
    return *this;
}

bool StoreFile::write(std::string_view bytes, std::size_t offset) const {
    while (!bytes.empty()) {
        const ssize_t written =
            ::pwrite(descriptor, bytes.data(), bytes.size(), static_cast<off_t>(offset));
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            return false;
        }
        bytes.remove_prefix(static_cast<std::size_t>(written));
        offset += static_cast<std::size_t>(written);
    }
    return true;
}

bool StoreFile::truncate(std::size_t size) const {
    return ::ftruncate(descriptor, static_cast<off_t>(size)) == 0;
}

bool StoreFile::lock() const {
    return ::flock(descriptor, LOCK_EX | LOCK_NB) == 0;
}

std::optional<std::string> StoreFile::read(const std::string& path, std::size_t most) {
    const StoreFile file(path, O_RDONLY);
    struct stat status = {};
    if (!file.isOpen() || ::fstat(file.descriptor, &status) != 0) {
        return std::nullopt;
    }
    if (!S_ISREG(status.st_mode) || static_cast<std::size_t>(status.st_size) > most) {
        errno = S_ISREG(status.st_mode) ? EFBIG : EINVAL;
        return std::nullopt;
    }
    std::string bytes(static_cast<std::size_t>(status.st_size), '\0');
    std::size_t there = 0;
    while (there < bytes.size()) {
        const ssize_t count = ::pread(file.descriptor, bytes.data() + there, bytes.size() - there,
                                      static_cast<off_t>(there));
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            return std::nullopt;
        }
        if (count == 0) {
            bytes.resize(there);
        }
        there += static_cast<std::size_t>(count);
    }
    return bytes;
}

}  // namespace LogCollector
