// Threads, clock and timers, names of hosts and interfaces.
#include "Hook.h"

namespace {

constexpr int NAME_FAILURE = -10;  // EAI_MEMORY

}  // namespace

// It returns its error.
TORTURE_EXPORT int pthread_create(void* thread, const void* attributes, void* (*start)(void*),
                                  void* argument);

int pthread_create(void* thread, const void* attributes, void* (*start)(void*), void* argument) {
    if (Torture::fails(Torture::Kind::THREADS, "pthread_create", __builtin_return_address(0))) {
        return EAGAIN;
    }
    return TORTURE_NEXT(int, pthread_create, (void*, const void*, void* (*)(void*), void*),
                        (thread, attributes, start, argument));
}

TORTURE_HOOK(CLOCK, EINVAL, -1, int, clock_gettime, (int clock, void* time), (clock, time));
TORTURE_HOOK(CLOCK, EINVAL, -1, int, clock_getres, (int clock, void* time), (clock, time));
TORTURE_HOOK(CLOCK, EINVAL, -1, int, gettimeofday, (void* time, void* zone), (time, zone));
TORTURE_HOOK(CLOCK, EOVERFLOW, -1, long, time, (long* result), (result));
TORTURE_HOOK(CLOCK, EMFILE, -1, int, timerfd_create, (int clock, int flags), (clock, flags));
TORTURE_HOOK(CLOCK, EINTR, -1, int, nanosleep, (const void* wanted, void* left), (wanted, left));

TORTURE_HOOK(NAMES, ENOMEM, NAME_FAILURE, int, getaddrinfo,
             (const char* node, const char* service, const void* hints, void** result),
             (node, service, hints, result));
TORTURE_HOOK(NAMES, ENOMEM, -1, int, getifaddrs, (void** list), (list));
TORTURE_HOOK(NAMES, ENOMEM, 0, unsigned, if_nametoindex, (const char* name), (name));
