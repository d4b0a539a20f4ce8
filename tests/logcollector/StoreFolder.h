#pragma once

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "logcollector/LogStoreOptions.h"
#include "support/ScratchDirectory.h"

/** The folder of a store, its files and what a test does to them. */
class StoreFolder {
  public:
    std::string path() const { return scratch.path("store"); }

    /** The path of segment `number`. */
    std::string pathOf(int number) const {
        std::string digits = std::to_string(number);
        digits.insert(0, 10 - digits.size(), '0');
        return path() + "/records-" + digits;
    }

    LogCollector::LogStoreOptions options(
        int64_t maxBytes = LogCollector::LogStoreOptions::MAX_BYTES_DFLT) const {
        LogCollector::LogStoreOptions options;
        options.folder = path();
        options.maxBytes = maxBytes;
        return options;
    }

    /** The names of all segments, in their order. */
    std::vector<std::string> segments() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(path())) {
            const std::string name = entry.path().filename().string();
            if (name != "lock") {
                names.push_back(name);
            }
        }
        std::sort(names.begin(), names.end());
        return names;
    }

    /** The bytes of all segments together. */
    std::size_t size() const {
        std::size_t sum = 0;
        for (const std::string& name : segments()) {
            sum += std::filesystem::file_size(path() + "/" + name);
        }
        return sum;
    }

    std::string read(int segment) const {
        return TestSupport::ScratchDirectory::read(pathOf(segment));
    }

    /** Replaces the bytes of a segment, or makes it; the folder must be there. */
    void write(int segment, const std::string& bytes) const {
        std::ofstream(pathOf(segment), std::ios::binary) << bytes;
    }

  private:
    const TestSupport::ScratchDirectory scratch;
};
