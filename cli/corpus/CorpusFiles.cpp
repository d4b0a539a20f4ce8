#include "CorpusFiles.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <filesystem>
#include <system_error>

#include "cli/ClipSamples.h"
#include "cli/UsageError.h"

namespace Cli {

namespace {

namespace fs = std::filesystem;

const int RATE_OF_OTHERS_HZ = 16000;

bool isSound(const fs::path& path) {
    static const std::array<const char*, 8> EXTENSIONS = {".wav", ".flac", ".ogg", ".aiff",
                                                          ".aif", ".au",   ".caf", ".mp3"};
    std::string extension = path.extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(), [](char character) {
        return static_cast<char>(std::tolower(static_cast<unsigned char>(character)));
    });
    return std::find(EXTENSIONS.begin(), EXTENSIONS.end(), extension) != EXTENSIONS.end();
}

bool matches(const std::string& group, const std::string& pattern) {
    if (!pattern.empty() && pattern.back() == '*') {
        return group.compare(0, pattern.size() - 1, pattern, 0, pattern.size() - 1) == 0;
    }
    return group == pattern;
}

bool isWanted(const std::string& group, const std::vector<std::string>& patterns) {
    return patterns.empty() ||
           std::any_of(patterns.begin(), patterns.end(),
                       [&group](const std::string& pattern) { return matches(group, pattern); });
}

CorpusEntry toEntry(const fs::path& path, const fs::path& folder) {
    const fs::path name = path.lexically_relative(folder);
    const std::string group = name.parent_path().generic_string();
    return {path.string(), fs::path(path).replace_extension(".txt").string(), name.generic_string(),
            group.empty() ? "." : group};
}

}  // namespace

std::vector<CorpusEntry> findSounds(const std::string& folder,
                                    const std::vector<std::string>& groups) {
    std::vector<CorpusEntry> entries;
    std::error_code error;
    fs::recursive_directory_iterator place(folder, error);
    for (; !error && place != fs::recursive_directory_iterator(); place.increment(error)) {
        std::error_code ignored;
        if (place->is_regular_file(ignored) && isSound(place->path())) {
            CorpusEntry entry = toEntry(place->path(), folder);
            if (isWanted(entry.group, groups)) {
                entries.push_back(std::move(entry));
            }
        }
    }
    if (error) {
        throw UsageError("cannot read " + folder + ": " + error.message());
    }
    if (entries.empty()) {
        throw UsageError("there is no sound in " + folder +
                         (groups.empty() ? "" : " that belongs to the groups"));
    }
    std::sort(
        entries.begin(), entries.end(),
        [](const CorpusEntry& left, const CorpusEntry& right) { return left.name < right.name; });
    return entries;
}

CorpusSound readSound(const CorpusEntry& entry) {
    const AudioClip clip = readAudioFile(entry.path);
    CorpusSound sound;
    const bool isKnown =
        clip.sampleRateHz == 8000 || clip.sampleRateHz == 16000 || clip.sampleRateHz == 32000;
    sound.rateHz = isKnown ? clip.sampleRateHz : RATE_OF_OTHERS_HZ;
    sound.samples = toSamples(clip, sound.rateHz);
    return sound;
}

CorpusSound readLabelledSound(const CorpusEntry& entry) {
    CorpusSound sound = readSound(entry);
    sound.speech = readLabels(entry.labelPath, sound.lengthMs());
    return sound;
}

}  // namespace Cli
