/**
 * @file
 * The files of one recording.
 */
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "logcollector/impl/StoreFile.h"

namespace Talvox {

/**
 * Writes the three files of a recording, on the writer's thread; only `isBroken` and `breakOff` are
 * for any thread. Each line is written by one call, so that whatever ends the process, all lines
 * but the last are whole.
 */
class RecordingFiles {
  public:
    /** @param sampleRateHz of the sound; 0 for a recording without sound */
    explicit RecordingFiles(int sampleRateHz) : sampleRate(sampleRateHz) {}

    /** Makes the files in a folder that exists. @return false when that is not possible */
    bool open(const std::string& folder, std::string_view description);

    /** Appends whole lines. @return false when the recording has ended because of the disk */
    bool writeLines(std::string_view lines);
    bool writeSound(std::string_view bytes);

    /** Writes the last line and the lengths of the sound, and closes. */
    void close(std::string_view reason, int64_t time);

    bool isOpen() const { return events.has_value(); }
    /** Bytes of all files. */
    int64_t getSize() const {
        return static_cast<int64_t>(descriptionSize + eventsSize) + soundSize();
    }

    /** Whether nothing more is recorded. Set before the writer knows of it. */
    bool isBroken() const { return broken; }
    /** @return true for the first call */
    bool breakOff() { return !broken.exchange(true); }

  private:
    int64_t soundSize() const;
    void fail(const char* what);
    bool appendEvents(std::string_view lines);
    void finishSound();

    const int sampleRate;
    std::atomic<bool> broken{false};
    std::optional<LogCollector::StoreFile> events;
    std::optional<LogCollector::StoreFile> sound;
    std::size_t descriptionSize = 0;
    std::size_t eventsSize = 0;
    std::size_t soundBytes = 0;
};

}  // namespace Talvox
