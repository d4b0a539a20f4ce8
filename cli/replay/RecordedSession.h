#pragma once

#include <boost/shared_ptr.hpp>
#include <nlohmann/json.hpp>
#include <string>
#include <utility>
#include <vector>

#include "talvox/Settings.h"

namespace Cli {

/** A recording as it is on the disk; see docs/RECORDING.md. */
struct RecordedSession {
    explicit RecordedSession(nlohmann::json content) : description(std::move(content)) {}
    // Copied, not moved: a move of JSON checks itself and so may throw.
    RecordedSession(const RecordedSession&) = default;
    RecordedSession& operator=(const RecordedSession&) = default;
    ~RecordedSession() = default;

    nlohmann::json description;
    std::vector<nlohmann::json> lines;
    /** Samples, 16-bit little-endian. */
    std::string sound;
};

/**
 * Reads a recording. One whose process was killed is read up to its last whole line.
 * @param folder holds `session.json`
 * @throws UsageError when it is not a recording, of another version, or has no sound
 */
RecordedSession readRecording(const std::string& folder);

/** Settings of a recording. @throws UsageError when a value is not of its key's type */
boost::shared_ptr<Talvox::Settings> readSettings(const nlohmann::json& settings);

}  // namespace Cli
