/**
 * @file
 * How the preloaded library replaces a function.
 */
#pragma once

#include <dlfcn.h>

#include <atomic>
#include <cerrno>

#include "Inject.h"

namespace Torture {

/**
 * Counts a call of this kind.
 * @param caller where the replaced function returns to: the sanitizers' own calls do not count
 * @return true when it is to fail
 */
bool fails(Kind kind, const char* name, const void* caller);

/** Whether calls of this thread count now. */
bool counts();

/** Keeps the calls that a thread makes inside one function out of the count. */
class Exempt {
  public:
    Exempt() { tortureExempt(1); }
    ~Exempt() { tortureExempt(-1); }
    Exempt(const Exempt&) = delete;
    Exempt& operator=(const Exempt&) = delete;
};

/**
 * A function of a library that a program has loaded for itself alone, as a Java VM does; null where
 * there is none.
 */
void* findInLoadedLibraries(const char* name);

/** The function that this library stands in front of. */
template <typename Function>
Function find(std::atomic<void*>& known, const char* name) {
    void* function = known.load(std::memory_order_relaxed);
    if (function == nullptr) {
        function = dlsym(RTLD_NEXT, name);
        function = function != nullptr ? function : findInLoadedLibraries(name);
        known.store(function, std::memory_order_relaxed);
    }
    return reinterpret_cast<Function>(function);
}

}  // namespace Torture

#define TORTURE_EXPORT extern "C" __attribute__((visibility("default")))

/** Calls the function itself. */
#define TORTURE_NEXT(RESULT, NAME, PARAMETERS, ARGUMENTS)                   \
    [&]() -> RESULT {                                                       \
        static std::atomic<void*> known{nullptr};                           \
        return Torture::find<RESULT(*) PARAMETERS>(known, #NAME) ARGUMENTS; \
    }()

/**
 * Replaces a function. It is declared here alone: a header of it would add exception
 * specifications and attributes that differ from system to system.
 */
#define TORTURE_HOOK(KIND, ERROR, FAILED, RESULT, NAME, PARAMETERS, ARGUMENTS)         \
    TORTURE_EXPORT RESULT NAME PARAMETERS;                                             \
    RESULT NAME PARAMETERS {                                                           \
        if (Torture::fails(Torture::Kind::KIND, #NAME, __builtin_return_address(0))) { \
            errno = ERROR;                                                             \
            return FAILED;                                                             \
        }                                                                              \
        return TORTURE_NEXT(RESULT, NAME, PARAMETERS, ARGUMENTS);                      \
    }                                                                                  \
    static_assert(true, "")
