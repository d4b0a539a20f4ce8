#pragma once

#include <cstdint>
#include <fstream>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "CorpusScore.h"

namespace Cli {

/**
 * The verdicts of a sweep on disk: a text file with a line per sound, written as soon as the sound
 * is scored, so that an interrupted sweep goes on where it was. A line counts only if it is whole
 * and the sound, its labels, the setups and the form of the file are still the same.
 */
class SweepStore {
  public:
    /** @param path created if it does not exist; if that is not possible, nothing is kept */
    SweepStore(const std::string& path, const std::vector<DetectorSetup>& setups);

    bool isWritable() const { return file_.is_open(); }

    /** A number for everything that the verdicts on a sound depend on. Any thread. */
    uint64_t fingerprint(const CorpusSound& sound) const;

    /** Whether the verdicts were known; they are then in `bySetup`. Any thread. */
    bool load(const std::string& name, uint64_t fingerprint,
              std::vector<std::vector<Verdict>>& bySetup) const;

    /** Any thread. */
    void save(const std::string& name, uint64_t fingerprint,
              const std::vector<std::vector<Verdict>>& bySetup);

    /** Sounds whose verdicts were loaded. */
    int loadedCount() const { return loaded_; }

  private:
    const std::size_t setupCount_;
    uint64_t setupsFingerprint_ = 0;
    std::map<std::string, std::string> lines_;
    mutable int loaded_ = 0;
    mutable std::mutex mutex_;
    std::ofstream file_;
};

}  // namespace Cli
