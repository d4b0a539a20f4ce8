#include "support/AllocationCount.h"

#include <atomic>
#include <cstddef>

#include "pal/kd_event.h"

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define SANITIZER_REPORTS_ALLOCATIONS
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define SANITIZER_REPORTS_ALLOCATIONS
#endif
#endif

#ifdef SANITIZER_REPORTS_ALLOCATIONS
// GCC installs no header for it.
// NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizers' choice of name
extern "C" int __sanitizer_install_malloc_and_free_hooks(
    void (*onMalloc)(const volatile void* memory, std::size_t size),
    void (*onFree)(const volatile void* memory));
#endif

namespace {

std::atomic<uint64_t> all{0};
std::atomic<uint64_t> onAudioThread{0};
std::atomic<uint64_t> underEventLock{0};

// The lock's state is asked for only once the program runs: the loader allocates, too.
std::atomic<bool> isClassifying{false};
thread_local bool isAudioThread = false;

void count() {
    all.fetch_add(1, std::memory_order_relaxed);
    if (!isClassifying.load(std::memory_order_relaxed)) {
        return;
    }
    if (isAudioThread) {
        onAudioThread.fetch_add(1, std::memory_order_relaxed);
    }
    if (kdHoldsEventLockKOR() != 0) {
        underEventLock.fetch_add(1, std::memory_order_relaxed);
    }
}

#ifdef SANITIZER_REPORTS_ALLOCATIONS
const int installed = __sanitizer_install_malloc_and_free_hooks(
    [](const volatile void*, std::size_t) { count(); }, [](const volatile void*) {});
#endif

}  // namespace

#ifndef SANITIZER_REPORTS_ALLOCATIONS
// The names under which glibc keeps its own allocator reachable for programs that wrap it.
extern "C" {
// NOLINTBEGIN(bugprone-reserved-identifier): glibc's choice of names
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* memory, std::size_t size);
// NOLINTEND(bugprone-reserved-identifier)

void* malloc(std::size_t size) {
    count();
    return __libc_malloc(size);
}

void* calloc(std::size_t number, std::size_t size) {
    count();
    return __libc_calloc(number, size);
}

void* realloc(void* memory, std::size_t size) {
    count();
    return __libc_realloc(memory, size);
}
}
#endif

namespace TestSupport {

AllocationCounts countAllocations() {
    isClassifying = true;
    return {all.load(), onAudioThread.load(), underEventLock.load()};
}

void markAudioThread() {
    isAudioThread = true;
}

}  // namespace TestSupport
