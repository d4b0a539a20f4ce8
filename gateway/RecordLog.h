#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <string>
#include <thread>

namespace Gateway {

/**
 * The usage records of all clients, one line each, appended to a file or to the standard output:
 *
 *     2026-03-01T12:00:00Z uuid=UUID RECORD
 *
 * Control characters and backslashes are written as \xNN, blanks in the uuid as well, all other
 * bytes as they are; so a record is one line and every byte can be had back. A line is handed to
 * the system at once. A file is synced by a thread of its own, which takes all lines that came in
 * while it was busy in one go; nobody waits for it.
 */
class RecordLog {
  public:
    RecordLog() = default;
    /** Closes. */
    ~RecordLog();
    RecordLog(const RecordLog&) = delete;
    RecordLog& operator=(const RecordLog&) = delete;

    /** @param path empty for the standard output. @return an empty text, or what went wrong */
    std::string open(const std::string& path);

    /** Writes what has come in to the disk, and ends; does nothing when closed. */
    void close();

    /** Any thread. @return false when the line could not be written */
    bool append(const std::string& uuid, const std::string& record);

    /** How often the file was synced. */
    std::size_t getSyncCount() const;

  private:
    bool write(const std::string& line);
    void syncAsLinesCome();

    int file = -1;
    bool tornLine = false;
    mutable std::mutex mutex;
    std::condition_variable changed;
    std::size_t unsyncedLines = 0;
    std::size_t syncs = 0;
    bool closing = false;
    std::thread syncer;
};

}  // namespace Gateway
