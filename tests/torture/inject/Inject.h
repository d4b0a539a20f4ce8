/**
 * @file
 * Control of the preloaded library that lets calls fail.
 *
 * The library stands in front of the C library, the C++ allocator, the sound client and the TLS
 * library. Each function that it replaces belongs to a kind. Once armed, the library counts the
 * calls of each kind on all threads, and one kind's call fails: once, or from that call on. Nothing
 * in it allocates, so that the number of a call means the same in every run.
 *
 * A program finds these functions with `dlsym`, and thus works, without faults, when the library is
 * not preloaded. Arm and disarm on one thread; all else may be called on any.
 */
#pragma once

#include <cstddef>

namespace Torture {

/** What fails. The order is that of the document. `SPACE` is no call: see Room.h. */
enum class Kind : int {
    MEMORY,
    THREADS,
    DESCRIPTORS,
    SOCKETS,
    FILES,
    CLOCK,
    NAMES,
    PULSE,
    TLS,
    SPACE
};

constexpr int KIND_COUNT = 10;

/** Stands for no kind: calls are counted and none fails. */
constexpr int NO_KIND = -1;

/** The deepest stack that is kept of the first call that failed. */
constexpr std::size_t STACK_MAX = 48;

/** Where the first call that failed came from. */
struct Failure {
    void* stack[STACK_MAX] = {};
    int depth = 0;
};

}  // namespace Torture

#pragma GCC visibility push(default)
extern "C" {

/**
 * Counts from now on, and lets a call fail.
 * @param kind  a `Torture::Kind`, or `NO_KIND`
 * @param call  counted from 1
 * @param onward 1 if all later calls of the kind fail as well
 * @param withStack 1 to keep the stack of the first call that fails
 * @param failedName receives the name of the function that fails first, before it fails
 */
void tortureArm(int kind, long call, int onward, int withStack, const char** failedName);

/**
 * From the next `tortureArm` on, only calls that are made from these libraries count; without any,
 * all calls do. For programs such as a Java VM, which has no use for calls that fail.
 * @param library a part of the path of its file; must stay valid
 */
void tortureRestrictTo(const char* library);

/** From now on every call reaches its function. What was counted is kept. */
void tortureDisarm();

/** Calls of a kind while the library was armed. */
long tortureCountCalls(int kind);

/** The first failure since the library was armed. */
const Torture::Failure* tortureFailure();

/**
 * Calls of this thread neither fail nor count while its level is above 0. Each thread begins with
 * 0.
 * @param change added to the level
 */
void tortureExempt(int change);
}
#pragma GCC visibility pop
