// Files, and the streams of the C library over them. Calls on pipes, event counters and the like
// pass: with valid arguments the system does not let them fail. A socket's calls are of its kind.
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/types.h>

#include <cstddef>
#include <cstdio>

#include "Hook.h"

namespace {

using Torture::Kind;

constexpr int STREAM_ERROR_FLAG = 0x20;  // what `ferror` looks at

bool failsOn(int descriptor, const char* name, int error, const void* caller) {
    struct stat status {};
    if (!Torture::counts() || ::fstat(descriptor, &status) != 0) {
        return false;
    }
    if (S_ISREG(status.st_mode) && Torture::fails(Kind::FILES, name, caller)) {
        errno = error;
        return true;
    }
    if (S_ISSOCK(status.st_mode) && Torture::fails(Kind::SOCKETS, name, caller)) {
        errno = ECONNRESET;
        return true;
    }
    return false;
}

bool failsOn(FILE* stream, const char* name, int error, const void* caller) {
    if (!Torture::counts() || !failsOn(::fileno(stream), name, error, caller)) {
        return false;
    }
    stream->_flags |= STREAM_ERROR_FLAG;
    return true;
}

/** A stream needs a descriptor, and a file. */
bool failsToOpen(const char* name, const void* caller) {
    if (Torture::fails(Kind::DESCRIPTORS, name, caller)) {
        errno = EMFILE;
        return true;
    }
    if (Torture::fails(Kind::FILES, name, caller)) {
        errno = ENOSPC;
        return true;
    }
    return false;
}

}  // namespace

#define TORTURE_FILE_HOOK(ERROR, RESULT, NAME, PARAMETERS, ARGUMENTS, DESCRIPTOR) \
    TORTURE_EXPORT RESULT NAME PARAMETERS;                                        \
    RESULT NAME PARAMETERS {                                                      \
        if (failsOn(DESCRIPTOR, #NAME, ERROR, __builtin_return_address(0))) {     \
            return static_cast<RESULT>(-1);                                       \
        }                                                                         \
        return TORTURE_NEXT(RESULT, NAME, PARAMETERS, ARGUMENTS);                 \
    }                                                                             \
    static_assert(true, "")

TORTURE_FILE_HOOK(EIO, ssize_t, read, (int file, void* bytes, std::size_t size),
                  (file, bytes, size), file);
TORTURE_FILE_HOOK(EIO, ssize_t, __read_chk,
                  (int file, void* bytes, std::size_t size, std::size_t room),
                  (file, bytes, size, room), file);
TORTURE_FILE_HOOK(EIO, ssize_t, pread64, (int file, void* bytes, std::size_t size, off64_t place),
                  (file, bytes, size, place), file);
TORTURE_FILE_HOOK(EIO, ssize_t, readv, (int file, const struct iovec* pieces, int count),
                  (file, pieces, count), file);
TORTURE_FILE_HOOK(ENOSPC, ssize_t, write, (int file, const void* bytes, std::size_t size),
                  (file, bytes, size), file);
TORTURE_FILE_HOOK(ENOSPC, ssize_t, writev, (int file, const struct iovec* pieces, int count),
                  (file, pieces, count), file);
TORTURE_FILE_HOOK(ENOSPC, ssize_t, pwrite64,
                  (int file, const void* bytes, std::size_t size, off64_t place),
                  (file, bytes, size, place), file);
TORTURE_FILE_HOOK(EIO, off_t, lseek, (int file, off_t place, int origin), (file, place, origin),
                  file);
TORTURE_FILE_HOOK(EIO, off64_t, lseek64, (int file, off64_t place, int origin),
                  (file, place, origin), file);
TORTURE_FILE_HOOK(EIO, int, fsync, (int file), (file), file);
TORTURE_FILE_HOOK(EIO, int, fdatasync, (int file), (file), file);
TORTURE_FILE_HOOK(EIO, int, ftruncate, (int file, off_t size), (file, size), file);
TORTURE_FILE_HOOK(EIO, int, fflush, (FILE * stream), (stream), stream);
TORTURE_FILE_HOOK(EIO, int, fseek, (FILE * stream, long place, int origin), (stream, place, origin),
                  stream);
TORTURE_FILE_HOOK(EIO, int, fseeko, (FILE * stream, off_t place, int origin),
                  (stream, place, origin), stream);
TORTURE_FILE_HOOK(EIO, int, fseeko64, (FILE * stream, off64_t place, int origin),
                  (stream, place, origin), stream);

TORTURE_EXPORT FILE* fopen(const char* path, const char* mode);
TORTURE_EXPORT FILE* fopen64(const char* path, const char* mode);
TORTURE_EXPORT std::size_t fread(void* items, std::size_t size, std::size_t count, FILE* stream);
TORTURE_EXPORT std::size_t fwrite(const void* items, std::size_t size, std::size_t count,
                                  FILE* stream);
TORTURE_EXPORT int fclose(FILE* stream);
TORTURE_EXPORT int close(int descriptor);

FILE* fopen(const char* path, const char* mode) {
    return failsToOpen("fopen", __builtin_return_address(0))
               ? nullptr
               : TORTURE_NEXT(FILE*, fopen, (const char*, const char*), (path, mode));
}

FILE* fopen64(const char* path, const char* mode) {
    return failsToOpen("fopen64", __builtin_return_address(0))
               ? nullptr
               : TORTURE_NEXT(FILE*, fopen64, (const char*, const char*), (path, mode));
}

std::size_t fread(void* items, std::size_t size, std::size_t count, FILE* stream) {
    return failsOn(stream, "fread", EIO, __builtin_return_address(0))
               ? 0
               : TORTURE_NEXT(std::size_t, fread, (void*, std::size_t, std::size_t, FILE*),
                              (items, size, count, stream));
}

std::size_t fwrite(const void* items, std::size_t size, std::size_t count, FILE* stream) {
    return failsOn(stream, "fwrite", ENOSPC, __builtin_return_address(0))
               ? 0
               : TORTURE_NEXT(std::size_t, fwrite, (const void*, std::size_t, std::size_t, FILE*),
                              (items, size, count, stream));
}

// A close that fails has closed all the same.
int fclose(FILE* stream) {
    const bool failed = failsOn(stream, "fclose", EIO, __builtin_return_address(0));
    const int result = TORTURE_NEXT(int, fclose, (FILE*), (stream));
    errno = failed ? EIO : errno;
    return failed ? EOF : result;
}

int close(int descriptor) {
    const bool failed = failsOn(descriptor, "close", EIO, __builtin_return_address(0));
    const int result = TORTURE_NEXT(int, close, (int), (descriptor));
    errno = failed ? EIO : errno;
    return failed ? -1 : result;
}
