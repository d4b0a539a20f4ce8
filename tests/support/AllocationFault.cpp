#include "support/AllocationFault.h"

#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

thread_local int allocationsLeft = 0;  // until the first one that fails; 0 for no fault
thread_local bool failsFromThereOn = false;
thread_local bool failed = false;

bool isToFail() {
    if (failed && failsFromThereOn) {
        return true;
    }
    if (allocationsLeft == 0 || --allocationsLeft > 0) {
        return false;
    }
    failed = true;
    return true;
}

void* allocate(std::size_t size) noexcept {
    return isToFail() ? nullptr : std::malloc(size > 0 ? size : 1);
}

void* allocateOrThrow(std::size_t size) {
    void* const bytes = allocate(size);
    if (bytes == nullptr) {
        throw std::bad_alloc();
    }
    return bytes;
}

}  // namespace

#pragma GCC visibility push(default)
void* operator new(std::size_t size) {
    return allocateOrThrow(size);
}
void* operator new[](std::size_t size) {
    return allocateOrThrow(size);
}
void* operator new(std::size_t size, const std::nothrow_t& /*how*/) noexcept {
    return allocate(size);
}
void* operator new[](std::size_t size, const std::nothrow_t& /*how*/) noexcept {
    return allocate(size);
}
void operator delete(void* bytes) noexcept {
    std::free(bytes);
}
void operator delete[](void* bytes) noexcept {
    std::free(bytes);
}
void operator delete(void* bytes, std::size_t /*size*/) noexcept {
    std::free(bytes);
}
void operator delete[](void* bytes, std::size_t /*size*/) noexcept {
    std::free(bytes);
}
#pragma GCC visibility pop

namespace TestSupport {

AllocationFault::AllocationFault(int number, Extent extent) {
    failed = false;
    failsFromThereOn = extent == ALL_FROM_THERE_ON;
    allocationsLeft = number;
}

AllocationFault::~AllocationFault() {
    allocationsLeft = 0;
    failsFromThereOn = false;
}

bool AllocationFault::hasHappened() {
    return failed;
}

}  // namespace TestSupport
