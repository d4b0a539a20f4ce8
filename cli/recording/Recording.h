#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace Cli {

/** The newest format of recordings that this tool reads (docs/RECORDING.md). */
const int RECORDING_FORMAT = 1;

/** A recorded session as it is on the disk. Its texts may hold anything. */
struct Recording {
    /**
     * Reads a folder. What a process that was killed left behind is read up to its last whole line,
     * and lines that cannot be read are left out; `remarks` says so.
     * @throws UsageError if the folder holds no recording, or one in a newer format
     */
    explicit Recording(const std::string& recordedFolder);
    Recording(const Recording&) = delete;
    Recording& operator=(const Recording&) = delete;

    const std::string folder;
    /** The object in session.json; of no member is the type known, except "format". */
    nlohmann::ordered_json session;
    /**
     * The lines of events.jsonl by time: objects with an integer "t" and a text "kind". Of other
     * members the type is unknown, see `textOf` and `numberOf`.
     */
    std::vector<nlohmann::ordered_json> lines;
    /** The sound; empty where there is none. */
    std::vector<int16_t> samples;
    int sampleRateHz = 0;
    /** What is missing or could not be read, each as a sentence. */
    std::vector<std::string> remarks;
};

/** A member as a text; empty if it is missing or no text. */
std::string textOf(const nlohmann::ordered_json& object, const char* name);

/** A member as an integer; `fallback` if it is missing, no integer or beyond 9e15. */
int64_t numberOf(const nlohmann::ordered_json& object, const char* name, int64_t fallback = 0);

/**
 * The recordings among folders: each folder itself, or those in it, by name.
 * @throws UsageError if one of the folders is no recording and has none in it
 */
std::vector<std::string> findRecordings(const std::vector<std::string>& folders);

}  // namespace Cli
