#include "WorkPool.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <mutex>
#include <system_error>
#include <thread>
#include <vector>

namespace Cli {

void runParallel(std::size_t count, unsigned threads,
                 const std::function<void(std::size_t)>& work) {
    std::atomic<std::size_t> next{0};
    std::mutex mutex;
    std::exception_ptr failure;
    const auto run = [&] {
        for (std::size_t index = next++; index < count; index = next++) {
            try {
                work(index);
            } catch (...) {
                const std::lock_guard<std::mutex> lock(mutex);
                failure = failure ? failure : std::current_exception();
                next = count;
            }
        }
    };
    const std::size_t wanted = threads > 0 ? threads : std::thread::hardware_concurrency();
    std::vector<std::thread> pool;
    try {
        while (pool.size() + 1 < std::min(wanted, count)) {
            pool.emplace_back(run);
        }
    } catch (const std::system_error&) {
        // Those that started share the work.
    }
    run();
    for (std::thread& thread : pool) {
        thread.join();
    }
    if (failure) {
        std::rethrow_exception(failure);
    }
}

}  // namespace Cli
