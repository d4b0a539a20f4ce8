#include "bench/AllocationCount.h"

#include <unistd.h>

#include <atomic>
#include <cstddef>
#include <ctime>
#include <fstream>

namespace {

std::atomic<uint64_t> allocations{0};

}  // namespace

// The names under which glibc keeps its own allocator reachable for programs that wrap it.
extern "C" {
// NOLINTBEGIN(bugprone-reserved-identifier)
// NOLINTBEGIN(bugprone-reserved-identifier): glibc's choice of names
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* memory, std::size_t size);
// NOLINTEND(bugprone-reserved-identifier)
// NOLINTEND(bugprone-reserved-identifier)

void* malloc(std::size_t size) {
    allocations.fetch_add(1, std::memory_order_relaxed);
    return __libc_malloc(size);
}

void* calloc(std::size_t count, std::size_t size) {
    allocations.fetch_add(1, std::memory_order_relaxed);
    return __libc_calloc(count, size);
}

void* realloc(void* memory, std::size_t size) {
    allocations.fetch_add(1, std::memory_order_relaxed);
    return __libc_realloc(memory, size);
}
}

namespace Bench {

uint64_t allocationCount() {
    return allocations.load(std::memory_order_relaxed);
}

long residentKiB() {
    std::ifstream file("/proc/self/statm");
    long total = 0;
    long resident = 0;
    file >> total >> resident;
    return resident * sysconf(_SC_PAGESIZE) / 1024;
}

double processCpuMs() {
    timespec time{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) * 1e3 + static_cast<double>(time.tv_nsec) / 1e6;
}

}  // namespace Bench
