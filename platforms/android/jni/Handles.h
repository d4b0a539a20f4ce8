/**
 * @file
 * What Java holds of native objects.
 */
#pragma once

#include <jni.h>

#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <cstdint>
#include <map>
#include <new>

#include "Env.h"
#include "Quarantine.h"

namespace Jni {

/** The number that stands for an address in Java. */
inline jlong toHandle(const void* address) {
    return static_cast<jlong>(reinterpret_cast<std::uintptr_t>(address));
}

/** Throws Java's `IllegalStateException` for a handle that names nothing. */
[[noreturn]] inline void raiseStale(JNIEnv* env, jlong handle) {
    raise(env, "java/lang/IllegalStateException",
          handle == 0 ? "not started or released already (null handle)"
                      : "released already (stale handle)");
}

/**
 * Handles through which Java owns objects: each is the address of a shared pointer on the heap,
 * but looked up before it is followed. One registry per type. Under the event lock.
 */
template <typename T>
class OwnedHandles {
  public:
    using Pointer = boost::shared_ptr<T>;

    static jlong add(const Pointer& object) {
        auto* const box = new (Quarantine::allocate(sizeof(Pointer))) Pointer(object);
        const jlong handle = toHandle(box);
        boxes().emplace(handle, box);
        return handle;
    }

    /** @throw PendingException with an `IllegalStateException` for a handle that is not live */
    static Pointer get(JNIEnv* env, jlong handle) { return *find(env, handle)->second; }

    /** Gives the handle back. @return what it held */
    static Pointer release(JNIEnv* env, jlong handle) {
        const auto found = find(env, handle);
        Pointer* const box = found->second;
        boxes().erase(found);
        Pointer object;
        object.swap(*box);
        box->~Pointer();
        Quarantine::free(box);
        return object;
    }

    /** Live handles. */
    static std::size_t count() { return boxes().size(); }

  private:
    using Boxes = std::map<jlong, Pointer*>;

    static Boxes& boxes() {
        static auto* const live = new Boxes;
        return *live;
    }

    static typename Boxes::iterator find(JNIEnv* env, jlong handle) {
        const auto found = boxes().find(handle);
        if (found == boxes().end()) {
            raiseStale(env, handle);
        }
        return found;
    }
};

/**
 * Objects that Java knows by their own address and does not own; each adds itself when it is made
 * and removes itself in its destructor. Under the event lock.
 */
template <typename T>
class KnownObjects {
  public:
    static jlong add(const boost::shared_ptr<T>& object) {
        const jlong handle = toHandle(object.get());
        objects()[handle] = object;
        return handle;
    }

    static void remove(const T* object) { objects().erase(toHandle(object)); }

    /** @throw PendingException with an `IllegalStateException` for an object that is gone */
    static boost::shared_ptr<T> get(JNIEnv* env, jlong handle) {
        boost::shared_ptr<T> object = find(handle);
        if (!object) {
            raiseStale(env, handle);
        }
        return object;
    }

    /** Null for an object that is gone. */
    static boost::shared_ptr<T> find(jlong handle) {
        const auto found = objects().find(handle);
        return found != objects().end() ? found->second.lock() : boost::shared_ptr<T>();
    }

  private:
    using Objects = std::map<jlong, boost::weak_ptr<T>>;

    static Objects& objects() {
        static auto* const known = new Objects;
        return *known;
    }
};

}  // namespace Jni
