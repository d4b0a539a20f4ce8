/**
 * @file
 * Starts programs of the tested architecture under the emulator.
 *
 * A program that an emulator runs starts others through the machine's kernel, which cannot run
 * those of the tested architecture. So these definitions stand before the C library's in every test
 * program of a cross build, and put the emulator in front. They serve ours and GoogleTest's death
 * tests. Programs of the machine itself (ffmpeg, openssl, a sound server) are started as they are.
 */
#include <dlfcn.h>
#include <elf.h>
#include <spawn.h>
#include <unistd.h>

#include <array>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <vector>

namespace {

constexpr const char* EMULATOR = TEST_EMULATOR;

std::array<unsigned char, sizeof(Elf64_Ehdr)> readHead(const char* path) {
    std::array<unsigned char, sizeof(Elf64_Ehdr)> head = {};
    std::FILE* const file = std::fopen(path, "rbe");
    if (file != nullptr) {
        if (std::fread(head.data(), 1, head.size(), file) == 0) {
            head.fill(0);
        }
        std::fclose(file);
    }
    return head;
}

/** Up to the machine's number, the heads of both classes agree. */
bool isOfTestedArchitecture(const char* path) {
#if defined(__aarch64__)
    constexpr unsigned char MACHINE = EM_AARCH64;
#else
    constexpr unsigned char MACHINE = EM_ARM;
#endif
    const auto head = readHead(path);
    return std::memcmp(head.data(), ELFMAG, SELFMAG) == 0 &&
           head[offsetof(Elf32_Ehdr, e_machine)] == MACHINE;
}

std::vector<char*> putEmulatorBefore(const char* path, char* const arguments[]) {
    std::vector<char*> all = {const_cast<char*>(EMULATOR), const_cast<char*>(path)};
    for (char* const* argument = arguments + 1; *argument != nullptr; ++argument) {
        all.push_back(*argument);
    }
    all.push_back(nullptr);
    return all;
}

template <typename Function>
Function* findNext(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace

extern "C" {

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name)
int execv(const char* path, char* const arguments[]) noexcept {
    auto* const next = findNext<int(const char*, char* const*)>("execv");
    return isOfTestedArchitecture(path) ? next(EMULATOR, putEmulatorBefore(path, arguments).data())
                                        : next(path, arguments);
}

int posix_spawn(pid_t* pid, const char* path, const posix_spawn_file_actions_t* actions,
                const posix_spawnattr_t* attributes, char* const arguments[],
                char* const environment[]) {
    auto* const next = findNext<decltype(posix_spawn)>("posix_spawn");
    return isOfTestedArchitecture(path)
               ? next(pid, EMULATOR, actions, attributes, putEmulatorBefore(path, arguments).data(),
                      environment)
               : next(pid, path, actions, attributes, arguments, environment);
}

int posix_spawnp(pid_t* pid, const char* name, const posix_spawn_file_actions_t* actions,
                 const posix_spawnattr_t* attributes, char* const arguments[],
                 char* const environment[]) {
    auto* const next = findNext<decltype(posix_spawnp)>("posix_spawnp");
    return isOfTestedArchitecture(name)
               ? next(pid, EMULATOR, actions, attributes, putEmulatorBefore(name, arguments).data(),
                      environment)
               : next(pid, name, actions, attributes, arguments, environment);
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)

}  // extern "C"
