/**
 * @file
 * Sessions that are recorded.
 */
#pragma once

#include <algorithm>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

#include "../cloud/SessionTest.h"
#include "support/ScratchDirectory.h"
#include "talvox/SessionRecording.h"

namespace RecordingTest {

using Json = nlohmann::json;
using Texts = std::vector<std::string>;

/** Records into a folder of its own. */
class RecordingFixture : public CloudTest::SessionTest {
  protected:
    ~RecordingFixture() override {
        session.reset();
        Talvox::SessionRecording::stop();
    }

    bool record(int64_t maxBytes = Talvox::SessionRecordingOptions::MAX_BYTES_DFLT,
                bool hasSound = true) {
        Talvox::SessionRecordingOptions options;
        options.folder = folder();
        options.maxBytes = maxBytes;
        options.hasSound = hasSound;
        options.source = "a test";
        return Talvox::SessionRecording::start(options);
    }

    std::string folder() const { return scratch.path("recordings"); }

    /** The recordings, in the order of their names. */
    std::vector<std::string> listRecordings() const {
        std::vector<std::string> paths;
        for (const auto& entry : std::filesystem::directory_iterator(folder())) {
            if (entry.is_directory()) {
                paths.push_back(entry.path());
            }
        }
        std::sort(paths.begin(), paths.end());
        return paths;
    }

    std::string read(const std::string& file, std::size_t index = 0) const {
        const std::vector<std::string> recordings = listRecordings();
        return index < recordings.size()
                   ? TestSupport::ScratchDirectory::read(recordings[index] + "/" + file)
                   : std::string();
    }

    std::vector<Json> readLines(std::size_t index = 0) const {
        std::vector<Json> lines;
        std::istringstream text(read("events.jsonl", index));
        for (std::string line; std::getline(text, line);) {
            lines.push_back(Json::parse(line));
        }
        return lines;
    }

    TestSupport::ScratchDirectory scratch;
};

}  // namespace RecordingTest
