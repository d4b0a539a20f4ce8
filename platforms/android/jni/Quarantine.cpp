#include "Quarantine.h"

#include <array>
#include <mutex>
#include <new>
#include <utility>

namespace Jni {

namespace {

struct Ring {
    std::mutex mutex;
    std::array<void*, Quarantine::BLOCKS_KEPT> blocks{};
    std::size_t next = 0;
};

Ring& ring() {
    static auto* const instance = new Ring;
    return *instance;
}

}  // namespace

void* Quarantine::allocate(std::size_t sizeInBytes) {
    ring();  // made now: freeing must not fail
    return ::operator new(sizeInBytes);
}

void Quarantine::free(void* block) noexcept {
    Ring& kept = ring();
    void* oldest = nullptr;
    {
        const std::lock_guard<std::mutex> lock(kept.mutex);
        oldest = std::exchange(kept.blocks[kept.next], block);
        kept.next = (kept.next + 1) % Quarantine::BLOCKS_KEPT;
    }
    ::operator delete(oldest);
}

}  // namespace Jni
