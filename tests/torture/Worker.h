/**
 * @file
 * A process that looks after victims, as the runner sees it.
 */
#pragma once

#include <sys/types.h>

#include <string>

#include "Order.h"

namespace Torture {

/** What became of a victim. */
struct Answer {
    bool served = false; /**< the process that looks after victims is there */
    Verdict verdict;
    std::string output; /**< standard output and error, sanitizers' reports included */
};

/** Starts this program again with the library preloaded, and gives it orders. One thread. */
class Worker {
  public:
    /**
     * @param program the path of this program
     * @param library the path of the preloaded library
     */
    Worker(const std::string& program, const std::string& library);
    ~Worker();
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    Answer serve(const Order& order);

  private:
    pid_t pid = -1;
    int orders = -1;
    int answers = -1;
};

}  // namespace Torture
