// Sockets: the system is short of buffers, or the connection breaks.
#include <cstddef>

#include "Hook.h"

// Both are also descriptors.
TORTURE_EXPORT int socket(int domain, int type, int protocol);
TORTURE_EXPORT int socketpair(int domain, int type, int protocol, int* ends);

namespace {

bool isRefused(const char* name, const void* caller) {
    if (Torture::fails(Torture::Kind::DESCRIPTORS, name, caller)) {
        errno = EMFILE;
        return true;
    }
    if (Torture::fails(Torture::Kind::SOCKETS, name, caller)) {
        errno = ENOBUFS;
        return true;
    }
    return false;
}

}  // namespace

int socket(int domain, int type, int protocol) {
    return isRefused("socket", __builtin_return_address(0))
               ? -1
               : TORTURE_NEXT(int, socket, (int, int, int), (domain, type, protocol));
}

int socketpair(int domain, int type, int protocol, int* ends) {
    return isRefused("socketpair", __builtin_return_address(0))
               ? -1
               : TORTURE_NEXT(int, socketpair, (int, int, int, int*),
                              (domain, type, protocol, ends));
}

TORTURE_HOOK(SOCKETS, ENETUNREACH, -1, int, connect, (int socket, const void* name, unsigned size),
             (socket, name, size));
TORTURE_HOOK(SOCKETS, EADDRINUSE, -1, int, bind, (int socket, const void* name, unsigned size),
             (socket, name, size));
TORTURE_HOOK(SOCKETS, EADDRINUSE, -1, int, listen, (int socket, int waiting), (socket, waiting));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, send,
             (int socket, const void* bytes, std::size_t size, int flags),
             (socket, bytes, size, flags));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, sendto,
             (int socket, const void* bytes, std::size_t size, int flags, const void* name,
              unsigned length),
             (socket, bytes, size, flags, name, length));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, sendmsg, (int socket, const void* message, int flags),
             (socket, message, flags));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, recv,
             (int socket, void* bytes, std::size_t size, int flags), (socket, bytes, size, flags));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, recvfrom,
             (int socket, void* bytes, std::size_t size, int flags, void* name, void* length),
             (socket, bytes, size, flags, name, length));
TORTURE_HOOK(SOCKETS, ECONNRESET, -1, long, recvmsg, (int socket, void* message, int flags),
             (socket, message, flags));
TORTURE_HOOK(SOCKETS, ENOBUFS, -1, int, getsockopt,
             (int socket, int level, int option, void* value, void* size),
             (socket, level, option, value, size));
TORTURE_HOOK(SOCKETS, ENOBUFS, -1, int, setsockopt,
             (int socket, int level, int option, const void* value, unsigned size),
             (socket, level, option, value, size));
TORTURE_HOOK(SOCKETS, ENOBUFS, -1, int, getsockname, (int socket, void* name, void* size),
             (socket, name, size));
TORTURE_HOOK(SOCKETS, ENOBUFS, -1, int, getpeername, (int socket, void* name, void* size),
             (socket, name, size));
TORTURE_HOOK(SOCKETS, ENOMEM, -1, int, poll, (void* entries, unsigned long count, int wait),
             (entries, count, wait));
TORTURE_HOOK(SOCKETS, ENOMEM, -1, int, ppoll,
             (void* entries, unsigned long count, const void* wait, const void* signals),
             (entries, count, wait, signals));
