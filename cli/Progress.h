#pragma once

#include <cstdint>
#include <mutex>
#include <ostream>
#include <string>

namespace Cli {

/**
 * A bar with the time that is left, rewritten in place, for work that takes longer than a second.
 * Goes by the platform clock. `show` may be called by any thread.
 */
class Progress {
  public:
    /** @param isTerminal nothing is written to anything else */
    Progress(std::ostream& output, bool isTerminal);
    /** Removes the bar. */
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

    /** @param share of the work that is done, 0 to 1; a lower one than before counts nothing */
    void show(double share);

  private:
    std::string bar(double share, int64_t elapsedMs) const;

    std::ostream& out_;
    const bool isTerminal_;
    const int64_t startMs_;
    std::mutex mutex_;
    int64_t shownMs_ = 0;
    double highest_ = 0;
    bool isShown_ = false;
};

}  // namespace Cli
