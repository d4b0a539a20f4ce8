/**
 * @file
 * Process-wide singletons with an ordered end.
 */
#pragma once

#include <atomic>
#include <memory>

#include "core/Export.h"
#include "core/util/EventLock.h"

namespace Util {

/** What the storage owns: anything that can be deleted. */
class KORVEL_CORE_API SingletonBase {
  public:
    virtual ~SingletonBase();

  protected:
    SingletonBase() = default;
    SingletonBase(const SingletonBase&) = delete;
    SingletonBase& operator=(const SingletonBase&) = delete;
};

/**
 * Owns every singleton. When the process ends, the platform layer first ends all deliveries; then
 * the singletons are deleted in the reverse order of their making, under the event lock, before the
 * static objects that existed when they were made.
 */
class KORVEL_CORE_API SingletonStorage {
  public:
    /** Takes ownership. Any thread. */
    static void addSingleton(SingletonBase* singleton);

    /** Deletes one singleton under the event lock; does nothing when it is null or gone already. */
    static void destroySingleton(SingletonBase* singleton);

    /**
     * Deletes all singletons now, the newest first, under the event lock; each is made anew at its
     * next use. For tests, and for embedders that do not need the engine any more.
     */
    static void destroyAll();

    /** Has deliveries end before what exists by now; for `Singleton`. */
    static void endEventsFirst();

    /**
     * The end of the process: as `destroySingleton`, unless a callback that never returned has kept
     * the event lock; then the singleton stays.
     */
    static void endSingleton(SingletonBase* singleton, bool staysAtProcessEnd);
};

/**
 * Base of a singleton class `T`, which derives from `Singleton<T>` and has a default constructor
 * that `Singleton<T>` may call. Classes that are used across library boundaries offer a
 * `getInstance` of their own that is not inline, so that there is one instance per process.
 *
 * A class whose objects are pointed to by what applications own hides `STAYS_AT_PROCESS_END` with
 * true: its instance is then left alone at the end of the process, when static objects of an
 * application may still use it.
 */
template <typename T>
class Singleton : public SingletonBase {
  public:
    /** The instance, made under the event lock on first use. Any thread. */
    static T& instance() {
        T* existing = pointer.load(std::memory_order_acquire);
        if (existing != nullptr) {
            return *existing;
        }
        const EventLock lock;
        if (pointer.load(std::memory_order_relaxed) == nullptr) {
            std::unique_ptr<T> made(new T());
            SingletonStorage::addSingleton(made.get());
            pointer.store(made.release(), std::memory_order_release);
            static const EndOfLibrary endOfLibrary;
            static const bool endsEvents = (SingletonStorage::endEventsFirst(), true);
            static_cast<void>(endsEvents);
        }
        return *pointer.load(std::memory_order_relaxed);
    }

    ~Singleton() override { pointer.store(nullptr, std::memory_order_release); }

    /** A class that hides this with true is not destroyed at the end of the process. */
    static constexpr bool STAYS_AT_PROCESS_END = false;

  protected:
    Singleton() = default;

  private:
    /** Made with the first instance, so it is destroyed before all that existed by then. */
    struct EndOfLibrary {
        EndOfLibrary() = default;
        ~EndOfLibrary() {
            SingletonStorage::endSingleton(pointer.load(std::memory_order_acquire),
                                           T::STAYS_AT_PROCESS_END);
        }
        EndOfLibrary(const EndOfLibrary&) = delete;
        EndOfLibrary& operator=(const EndOfLibrary&) = delete;
    };

    static inline std::atomic<T*> pointer{nullptr};
};

}  // namespace Util
