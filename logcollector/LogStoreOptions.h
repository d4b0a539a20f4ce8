/**
 * @file
 * Where and how long usage records are stored.
 */
#pragma once

#include <cstdint>
#include <string>

namespace LogCollector {

/** The folder and the bounds of a store of usage records. Plain values. */
struct LogStoreOptions {
    /** The default and the range of `maxBytes`. */
    static constexpr int64_t MAX_BYTES_DFLT = 4 << 20;
    static constexpr int64_t MAX_BYTES_LEAST = 4 << 10;
    static constexpr int64_t MAX_BYTES_MOST = 1 << 30;

    /** The default and the range of `maxAgeS`. */
    static constexpr int64_t MAX_AGE_S_DFLT = int64_t{30} * 24 * 60 * 60;
    static constexpr int64_t MAX_AGE_S_LEAST = 60;
    static constexpr int64_t MAX_AGE_S_MOST = int64_t{100} * 365 * 24 * 60 * 60;

    /**
     * A folder for the store alone, on a local file system. It is made if it is missing, but not
     * the folders above it; folder and files are readable for the user of the process only. One
     * process at a time can use it.
     */
    std::string folder;

    /** What the files of the folder may hold together, in bytes; `MAX_BYTES_LEAST` to `_MOST`. */
    int64_t maxBytes = MAX_BYTES_DFLT;

    /**
     * How long a record is kept, in seconds of the calendar clock; `MAX_AGE_S_LEAST` to `_MOST`.
     * A record goes when it is between 1 and 17/16 times as old. A clock that is set back, and put
     * right again, ages nothing as long as the store or the process has an earlier record; the
     * first records of a wrong clock are as old as that clock says.
     */
    int64_t maxAgeS = MAX_AGE_S_DFLT;
};

}  // namespace LogCollector
