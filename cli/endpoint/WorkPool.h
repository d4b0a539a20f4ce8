#pragma once

#include <cstddef>
#include <functional>

namespace Cli {

/**
 * Calls `work` once for each number below `count`, on several threads; returns when all calls have.
 * Where the system refuses threads, those that it gave, and the caller's own, do the work.
 * @param threads 0 for as many as there are processors
 * @param work    any thread; the first exception that leaves it ends the work and is thrown here
 */
void runParallel(std::size_t count, unsigned threads, const std::function<void(std::size_t)>& work);

}  // namespace Cli
