// A program that loads the plug-in PATH, lets it go when its threads hang, and only then lets these
// threads go on. Prints how long the unloading took.
//
// usage: teardown_host PATH FIFO
#include <dlfcn.h>
#include <fcntl.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "support/Threads.h"
#include "teardown/app/SilentNameServer.h"

namespace {

template <typename Function>
Function find(void* library, const char* name) {
    return reinterpret_cast<Function>(::dlsym(library, name));
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 3) {
        return 2;
    }
    ::setenv("PULSE_CLIENTCONFIG", argv[2], 1);
    void* const plugin = ::dlopen(argv[1], RTLD_NOW | RTLD_LOCAL);
    if (plugin == nullptr) {
        std::printf("%s\n", ::dlerror());
        return 2;
    }
    const std::string url = std::string("http://") + TearDown::SILENT_HOST;
    find<void (*)(const char*)>(plugin, "begin")(url.c_str());
    // Returns when the recorder's thread has opened the other side, from which it then reads.
    const int settings = ::open(argv[2], O_WRONLY | O_CLOEXEC);
    if (!TearDown::waitForQuestions(1)) {
        return 1;
    }
    const std::size_t threads = TestSupport::countThreads();
    find<void (*)()>(plugin, "end")();
    const auto begin = std::chrono::steady_clock::now();
    ::dlclose(plugin);
    const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - begin;
    std::printf("took %.3f\n", took.count());
    std::fflush(stdout);
    // The recorder's thread and that of the question.
    ::close(settings);
    TearDown::answerQuestions();
    const bool bothEnded = TestSupport::waitForThreads(
        [threads] { return TestSupport::countThreads() + 2 <= threads; });
    return bothEnded ? 0 : 1;
}
