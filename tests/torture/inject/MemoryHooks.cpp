// Memory: what allocates in C and in C++. Freeing never fails and is not replaced. A sanitizer asks
// for the stack of each new thread, and ends the process when the C library has no memory to tell.
#include <cstddef>
#include <new>

#include "Hook.h"

namespace {

using Torture::Kind;

/** `dlsym` itself may allocate, before the allocator is known; never given back. */
void* takeEarlyMemory(std::size_t size) {
    alignas(std::max_align_t) static char memory[4096];
    static std::atomic<std::size_t> used{0};
    constexpr std::size_t UNIT = alignof(std::max_align_t);
    const std::size_t begin = used.fetch_add((size + UNIT - 1) / UNIT * UNIT);
    return begin + size <= sizeof(memory) ? memory + begin : nullptr;
}

/** The allocator's function; null while it is being looked for. */
template <typename Function>
Function findAllocator(std::atomic<void*>& known, const char* name) {
    static std::atomic<bool> searches{false};
    if (known.load(std::memory_order_relaxed) == nullptr) {
        if (searches.exchange(true)) {
            return nullptr;
        }
        Torture::find<Function>(known, name);
        searches = false;
    }
    return Torture::find<Function>(known, name);
}

}  // namespace

TORTURE_EXPORT void* malloc(std::size_t size) noexcept;
TORTURE_EXPORT void* calloc(std::size_t count, std::size_t size) noexcept;

void* malloc(std::size_t size) noexcept {
    static std::atomic<void*> known{nullptr};
    if (Torture::fails(Kind::MEMORY, "malloc", __builtin_return_address(0))) {
        errno = ENOMEM;
        return nullptr;
    }
    const auto next = findAllocator<void* (*)(std::size_t)>(known, "malloc");
    return next != nullptr ? next(size) : takeEarlyMemory(size);
}

void* calloc(std::size_t count, std::size_t size) noexcept {
    static std::atomic<void*> known{nullptr};
    if (Torture::fails(Kind::MEMORY, "calloc", __builtin_return_address(0))) {
        errno = ENOMEM;
        return nullptr;
    }
    const auto next = findAllocator<void* (*)(std::size_t, std::size_t)>(known, "calloc");
    return next != nullptr ? next(count, size) : takeEarlyMemory(count * size);
}

TORTURE_EXPORT int pthread_getattr_np(unsigned long thread, void* attributes) noexcept;

int pthread_getattr_np(unsigned long thread, void* attributes) noexcept {
    const Torture::Exempt exempt;
    return TORTURE_NEXT(int, pthread_getattr_np, (unsigned long, void*), (thread, attributes));
}

TORTURE_EXPORT void* realloc(void* memory, std::size_t size) noexcept;
TORTURE_EXPORT int posix_memalign(void** result, std::size_t alignment, std::size_t size) noexcept;
TORTURE_EXPORT void* aligned_alloc(std::size_t alignment, std::size_t size) noexcept;

void* realloc(void* memory, std::size_t size) noexcept {
    if (Torture::fails(Kind::MEMORY, "realloc", __builtin_return_address(0))) {
        errno = ENOMEM;
        return nullptr;
    }
    return TORTURE_NEXT(void*, realloc, (void*, std::size_t), (memory, size));
}

int posix_memalign(void** result, std::size_t alignment, std::size_t size) noexcept {
    if (Torture::fails(Kind::MEMORY, "posix_memalign", __builtin_return_address(0))) {
        return ENOMEM;
    }
    return TORTURE_NEXT(int, posix_memalign, (void**, std::size_t, std::size_t),
                        (result, alignment, size));
}

void* aligned_alloc(std::size_t alignment, std::size_t size) noexcept {
    if (Torture::fails(Kind::MEMORY, "aligned_alloc", __builtin_return_address(0))) {
        errno = ENOMEM;
        return nullptr;
    }
    return TORTURE_NEXT(void*, aligned_alloc, (std::size_t, std::size_t), (alignment, size));
}

#pragma GCC visibility push(default)

void* operator new(std::size_t size) {
    if (Torture::fails(Kind::MEMORY, "operator new", __builtin_return_address(0))) {
        throw std::bad_alloc();
    }
    return TORTURE_NEXT(void*, _Znwm, (std::size_t), (size));
}

void* operator new[](std::size_t size) {
    if (Torture::fails(Kind::MEMORY, "operator new[]", __builtin_return_address(0))) {
        throw std::bad_alloc();
    }
    return TORTURE_NEXT(void*, _Znam, (std::size_t), (size));
}

void* operator new(std::size_t size, const std::nothrow_t& tag) noexcept {
    if (Torture::fails(Kind::MEMORY, "operator new (nothrow)", __builtin_return_address(0))) {
        return nullptr;
    }
    return TORTURE_NEXT(void*, _ZnwmRKSt9nothrow_t, (std::size_t, const std::nothrow_t&),
                        (size, tag));
}

void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept {
    if (Torture::fails(Kind::MEMORY, "operator new[] (nothrow)", __builtin_return_address(0))) {
        return nullptr;
    }
    return TORTURE_NEXT(void*, _ZnamRKSt9nothrow_t, (std::size_t, const std::nothrow_t&),
                        (size, tag));
}

#pragma GCC visibility pop
