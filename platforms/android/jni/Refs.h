/**
 * @file
 * Owners of Java references.
 */
#pragma once

#include <jni.h>

#include <utility>

namespace Jni {

/** A local reference, deleted at the end of its scope, so that loops and long calls do not pile
 * them up. Bound to the thread. */
template <typename T>
class LocalRef {
  public:
    LocalRef(JNIEnv* environment, T object) : env(environment), ref(object) {}
    LocalRef(LocalRef&& other) noexcept : env(other.env), ref(std::exchange(other.ref, nullptr)) {}
    LocalRef(const LocalRef&) = delete;
    LocalRef& operator=(const LocalRef&) = delete;
    LocalRef& operator=(LocalRef&&) = delete;
    ~LocalRef() {
        if (ref != nullptr) {
            env->DeleteLocalRef(ref);
        }
    }

    T get() const { return ref; }
    explicit operator bool() const { return ref != nullptr; }

    /** Leaves the reference to the caller, for what goes back to Java. */
    T release() { return std::exchange(ref, nullptr); }

    /** The same reference as one of a derived Java type. */
    template <typename Derived>
    LocalRef<Derived> as() && {
        return LocalRef<Derived>(env, static_cast<Derived>(release()));
    }

  private:
    JNIEnv* env;
    T ref;
};

/** A global reference; may be dropped on any thread. Empty where the VM is gone. */
class GlobalRef {
  public:
    GlobalRef() = default;
    /** @throw std::bad_alloc when the VM has no memory */
    GlobalRef(JNIEnv* env, jobject object);
    GlobalRef(GlobalRef&& other) noexcept : ref(std::exchange(other.ref, nullptr)) {}
    GlobalRef& operator=(GlobalRef&& other) noexcept;
    GlobalRef(const GlobalRef&) = delete;
    GlobalRef& operator=(const GlobalRef&) = delete;
    ~GlobalRef();

    void reset();
    jobject get() const { return ref; }
    jclass getClass() const { return static_cast<jclass>(ref); }
    explicit operator bool() const { return ref != nullptr; }

  private:
    jobject ref = nullptr;
};

/**
 * Releases every local reference made within its scope: native threads that are attached for long
 * never return to Java, which would do it. A VM that refuses the frame costs nothing but this:
 * each reference still has its own owner.
 */
class LocalFrame {
  public:
    /**
     * @param capacity how many references the frame is made for
     * @param enough what is asked for if the VM refuses that: it bounds the size of a frame, and
     *     this many are alive at one time
     */
    LocalFrame(JNIEnv* environment, jint capacity, jint enough);
    LocalFrame(JNIEnv* environment, jint capacity) : LocalFrame(environment, capacity, capacity) {}
    ~LocalFrame();
    LocalFrame(const LocalFrame&) = delete;
    LocalFrame& operator=(const LocalFrame&) = delete;

  private:
    bool push(jint capacity);

    JNIEnv* env;
    bool pushed;
};

}  // namespace Jni
