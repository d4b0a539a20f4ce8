// Descriptors: whatever makes one, for lack of room in the process's table.
#include <cstdarg>

#include "Hook.h"

namespace {

/** The third argument of `open`; unspecified, and not looked at, where none was given. */
#define TORTURE_OPEN(NAME)                                                                    \
    TORTURE_EXPORT int NAME(const char* path, int flags, ...);                                \
    int NAME(const char* path, int flags, ...) {                                              \
        va_list rest;                                                                         \
        va_start(rest, flags);                                                                \
        const int mode = va_arg(rest, int);                                                   \
        va_end(rest);                                                                         \
        if (Torture::fails(Torture::Kind::DESCRIPTORS, #NAME, __builtin_return_address(0))) { \
            errno = EMFILE;                                                                   \
            return -1;                                                                        \
        }                                                                                     \
        return TORTURE_NEXT(int, NAME, (const char*, int, ...), (path, flags, mode));         \
    }                                                                                         \
    static_assert(true, "")

}  // namespace

TORTURE_OPEN(open);
TORTURE_OPEN(open64);

TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, __open_2, (const char* path, int flags), (path, flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, __open64_2, (const char* path, int flags),
             (path, flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, openat,
             (int folder, const char* path, int flags, int mode), (folder, path, flags, mode));
TORTURE_HOOK(DESCRIPTORS, EMFILE, nullptr, void*, opendir, (const char* path), (path));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, pipe, (int* ends), (ends));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, pipe2, (int* ends, int flags), (ends, flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, eventfd, (unsigned value, int flags), (value, flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, epoll_create, (int size), (size));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, epoll_create1, (int flags), (flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, dup, (int descriptor), (descriptor));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, memfd_create, (const char* name, unsigned flags),
             (name, flags));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, shm_open, (const char* name, int flags, unsigned mode),
             (name, flags, mode));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, accept, (int socket, void* name, void* size),
             (socket, name, size));
TORTURE_HOOK(DESCRIPTORS, EMFILE, -1, int, accept4, (int socket, void* name, void* size, int flags),
             (socket, name, size, flags));
