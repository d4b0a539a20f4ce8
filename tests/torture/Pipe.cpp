#include "Pipe.h"

#include <unistd.h>

#include <cerrno>

namespace Torture {

namespace {

template <typename Byte, typename Transfer>
bool transferAll(Byte* bytes, std::size_t size, Transfer transfer) {
    while (size > 0) {
        const ssize_t count = transfer(bytes, size);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            return false;
        }
        bytes += count;
        size -= static_cast<std::size_t>(count);
    }
    return true;
}

}  // namespace

bool readAll(int descriptor, void* bytes, std::size_t size) {
    return transferAll(
        static_cast<char*>(bytes), size,
        [descriptor](char* place, std::size_t left) { return ::read(descriptor, place, left); });
}

bool writeAll(int descriptor, const void* bytes, std::size_t size) {
    return transferAll(static_cast<const char*>(bytes), size,
                       [descriptor](const char* place, std::size_t left) {
                           return ::write(descriptor, place, left);
                       });
}

}  // namespace Torture
