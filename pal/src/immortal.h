#pragma once

#include <new>
#include <utility>

namespace korvel_pal {

/**
 * Holds an object that is never destroyed, because threads may outlive the static objects of the
 * process. The object lies inside, so that making it takes no memory that could be missing.
 */
template <typename T>
class Immortal {
  public:
    template <typename... Args>
    explicit Immortal(Args&&... args) {
        new (storage) T(std::forward<Args>(args)...);
    }
    Immortal(const Immortal&) = delete;
    Immortal& operator=(const Immortal&) = delete;

    T& get() { return *std::launder(reinterpret_cast<T*>(storage)); }

  private:
    alignas(T) unsigned char storage[sizeof(T)];
};

}  // namespace korvel_pal
