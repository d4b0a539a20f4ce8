/**
 * @file
 * The thread that writes recordings.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "talvox/impl/recording/RecordingFiles.h"
#include "talvox/impl/recording/RecordingFolders.h"

namespace Talvox {

/**
 * Writes what sessions put into its queue. The queue is bounded: a recording for which there is no
 * room ends, and what was queued of it is still written.
 */
class RecordingWriter {
  public:
    using Files = boost::shared_ptr<RecordingFiles>;

    /** The most bytes that wait for the disk: over a minute of sound at 44.1 kHz. */
    static constexpr std::size_t MOST_QUEUED_BYTES = std::size_t{8} * 1024 * 1024;

    RecordingWriter(const std::string& folder, int64_t maxBytes);
    /** As `stop`. */
    ~RecordingWriter();
    RecordingWriter(const RecordingWriter&) = delete;
    RecordingWriter& operator=(const RecordingWriter&) = delete;

    /** @return false, with a line in the log, when the folder cannot be used or there is no thread
     */
    bool start();

    /** Ends the recordings that are open, and the thread. Waits for the disk. Not under its lock.
     */
    void stop();

    /** Makes a folder and the files. @param calendarTime in seconds since 1970 */
    void open(const Files& files, int64_t calendarTime, std::string description);
    /** Appends a line, which gets a line feed. @param isUrgent false if it may wait for the next */
    void writeLine(const Files& files, std::string line, bool isUrgent);
    void writeSound(const Files& files, const unsigned char* bytes, std::size_t size);
    /** @param time nanoseconds of the session; below 0 for unknown */
    void close(const Files& files, std::string reason, int64_t time);

  private:
    enum class Kind { OPEN, LINE, SOUND, CLOSE };
    struct Job {
        Files files;
        Kind kind;
        int64_t time;
        std::string bytes;
    };

    void put(Job job, bool isUrgent);
    void run();
    bool takeJobs(std::vector<Job>& taken);
    void perform(const std::vector<Job>& jobs);
    void perform(const Job& job);
    void openFiles(const Job& job);
    void closeCurrent(const char* reason);

    RecordingFolders folders;
    std::mutex mutex;
    std::condition_variable changed;
    std::vector<Job> jobs;
    std::size_t queuedBytes = 0;
    bool isWanted = false;
    bool stopping = false;
    std::thread thread;
    /** The recordings that are open; the thread's own. */
    std::vector<Files> current;
};

}  // namespace Talvox
