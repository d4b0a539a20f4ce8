/**
 * @file
 * The folder of all recordings.
 */
#pragma once

#include <cstdint>
#include <deque>
#include <string>

namespace Talvox {

/** Names the folders of recordings and removes the oldest ones. One thread at a time. */
class RecordingFolders {
  public:
    RecordingFolders(std::string rootFolder, int64_t maxBytes);

    /** Makes the root unless it is there. @return whether it can be used; if not, logs why */
    bool prepare() const;

    /** Makes the folder of a new recording. @return its path; empty, with a log line, on failure */
    std::string makeFolder(int64_t calendarTime);

    /**
     * Removes the oldest recordings until all of them are within the bound together with one that
     * is being written.
     * @param size of that one's files, in bytes
     * @return false when that one exceeds the bound alone
     */
    bool makeRoom(int64_t size);

  private:
    struct Entry {
        std::string path;
        int64_t size;
    };

    void list();

    const std::string root;
    const int64_t bound;
    int made = 0;
    /** Those that were there before the latest, oldest first. */
    std::deque<Entry> entries;
    int64_t entriesSize = 0;
};

}  // namespace Talvox
