/**
 * @file
 * The threads and descriptors of this process, as the system counts them.
 */
#pragma once

#include <chrono>
#include <cstddef>
#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>
#include <thread>

namespace TestSupport {

/** Entries of a directory such as /proc/self/fd. */
inline std::size_t countEntries(const std::string& path) {
    std::error_code ignored;
    std::size_t count = 0;
    std::filesystem::directory_iterator entry(path, ignored);
    for (; entry != std::filesystem::directory_iterator(); entry.increment(ignored)) {
        ++count;
    }
    return count;
}

/** Threads of this process; with a name, only those that bear it. */
inline std::size_t countThreads(const std::string& name = "") {
    const std::string tasks = "/proc/self/task";
    if (name.empty()) {
        return countEntries(tasks);
    }
    std::error_code ignored;
    std::size_t count = 0;
    std::filesystem::directory_iterator entry(tasks, ignored);
    for (; entry != std::filesystem::directory_iterator(); entry.increment(ignored)) {
        std::string found;
        std::getline(std::ifstream(entry->path() / "comm"), found);
        count += found == name ? 1 : 0;
    }
    return count;
}

/** Without the engine's workers: of them there are one to four, by how much was to do at a time. */
inline std::size_t countThreadsButWorkers() {
    return countThreads() - countThreads("talvox-worker");
}

/** Waits until something that threads of the process change holds; false when it takes too long. */
template <typename Condition>
bool waitForThreads(Condition condition) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end) {
            return false;
        }
        std::this_thread::yield();
    }
    return true;
}

}  // namespace TestSupport
