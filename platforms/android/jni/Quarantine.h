/**
 * @file
 * Memory whose address is not given out again soon.
 */
#pragma once

#include <cstddef>

namespace Jni {

/**
 * Memory of what Java knows by its address. Freed blocks wait behind the next `BLOCKS_KEPT` ones
 * before they can be allocated again, so that a handle that Java kept too long does not name
 * another object by chance. Any thread.
 */
class Quarantine {
  public:
    static constexpr std::size_t BLOCKS_KEPT = 256;

    static void* allocate(std::size_t sizeInBytes);
    static void free(void* block) noexcept;
};

/** The same for containers and `boost::allocate_shared`. */
template <typename T>
class QuarantineAllocator {
  public:
    using value_type = T;

    QuarantineAllocator() = default;
    template <typename Other>
    QuarantineAllocator(const QuarantineAllocator<Other>& /*other*/) {}

    T* allocate(std::size_t count) {
        return static_cast<T*>(Quarantine::allocate(count * sizeof(T)));
    }
    void deallocate(T* block, std::size_t /*count*/) noexcept { Quarantine::free(block); }

    template <typename Other>
    bool operator==(const QuarantineAllocator<Other>& /*other*/) const {
        return true;
    }
    template <typename Other>
    bool operator!=(const QuarantineAllocator<Other>& /*other*/) const {
        return false;
    }
};

}  // namespace Jni
