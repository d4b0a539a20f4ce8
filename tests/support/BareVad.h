/**
 * @file
 * The voice activity detector as the system's shared library offers it, without anything of ours.
 */
#pragma once

#include <dlfcn.h>

#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>

namespace TestSupport {

/**
 * The functions of the system's library. It exports some names that libKorvelLibs exports as well,
 * so it is loaded for this class alone and each function looked up in it.
 */
class BareVadLibrary {
  public:
    static const BareVadLibrary& get() {
        static const BareVadLibrary library;
        return library;
    }

    void* (*create)();
    int (*init)(void*);
    int (*setMode)(void*, int);
    int (*process)(void*, int, const int16_t*, std::size_t);
    void (*free)(void*);

  private:
    BareVadLibrary() {
        void* library = dlopen("libwebrtc_audio_processing.so.1", RTLD_NOW | RTLD_LOCAL);
        if (library == nullptr) {
            throw std::runtime_error(dlerror());
        }
        find(library, "WebRtcVad_Create", create);
        find(library, "WebRtcVad_Init", init);
        find(library, "WebRtcVad_set_mode", setMode);
        find(library, "WebRtcVad_Process", process);
        find(library, "WebRtcVad_Free", free);
    }

    template <typename Function>
    static void find(void* library, const char* name, Function& function) {
        function = reinterpret_cast<Function>(dlsym(library, name));
        if (function == nullptr) {
            throw std::runtime_error(std::string("not found: ") + name);
        }
    }
};

/** One instance of the bare detector. */
class BareVad {
  public:
    explicit BareVad(int mode) : instance(library.create()) {
        if (library.init(instance) != 0 || library.setMode(instance, mode) != 0) {
            throw std::runtime_error("the bare detector does not start");
        }
    }
    ~BareVad() { library.free(instance); }
    BareVad(const BareVad&) = delete;
    BareVad& operator=(const BareVad&) = delete;

    int process(int sampleRateHz, const int16_t* samples, std::size_t length) {
        return library.process(instance, sampleRateHz, samples, length);
    }

  private:
    const BareVadLibrary& library = BareVadLibrary::get();
    void* const instance;
};

}  // namespace TestSupport
