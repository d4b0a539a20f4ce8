/**
 * @file
 * Writes sessions down, so that they can be examined and replayed.
 */
#pragma once

#include <cstdint>
#include <string>

#include "talvox/Export.h"

namespace Talvox {

/** Where sessions are recorded, and what of them. */
struct SessionRecordingOptions {
    static constexpr int64_t MAX_BYTES_DFLT = int64_t{64} * 1024 * 1024;

    /** Each session gets a folder of its own in this one, which is made if its parent exists. */
    std::string folder;
    /**
     * Bound on all sessions in the folder together. The oldest ones are removed to stay within it;
     * a session that exceeds it alone is recorded up to the bound. Above 0.
     */
    int64_t maxBytes = MAX_BYTES_DFLT;
    /** False leaves the sound out; such a recording cannot be replayed. */
    bool hasSound = true;
    /** Copied into the recording: where the sound comes from, such as the name of a file. */
    std::string source;
};

/**
 * Records the sessions of the cloud recognizer in the format of docs/RECORDING.md. Off by default.
 *
 * A thread of its own writes. Sessions never wait for it: a recording that the disk refuses, or
 * that the disk is too slow for, ends with a mark and a line in the log, and its session goes on.
 */
class TALVOX_API SessionRecording {
  public:
    /**
     * Records every session that begins from now on; replaces what an earlier call has set, as
     * `stop` would first. Any thread, but not from a listener; waits for the disk.
     * @return false, with a line in the log, when the folder cannot be used or there is no thread
     */
    static bool start(const SessionRecordingOptions& options);

    /**
     * Ends recording, also of a running session, and returns when everything has been written. Any
     * thread, but not from a listener; waits for the disk. Call it before the process ends: what is
     * not written by then is lost. Does nothing when nothing is recorded.
     */
    static void stop();
};

}  // namespace Talvox
