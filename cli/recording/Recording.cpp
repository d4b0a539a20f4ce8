#include "Recording.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "cli/UsageError.h"

namespace Cli {

namespace {

using Json = nlohmann::ordered_json;
using std::filesystem::path;

const char* const SESSION_FILE = "session.json";
const std::size_t WAV_HEAD_BYTES = 44;
const int RATE_MIN = 1000;
const int RATE_MAX = 384000;
/** Far above what a session can write; a larger file is something else. */
const std::uintmax_t FILE_BYTES_MAX = 256ULL * 1024 * 1024;
/** Bound on numbers, so that sums of them do not overflow; 104 days in nanoseconds. */
const double NUMBER_MAX = 9e15;
const int DEPTH_MAX = 32;

bool isRecording(const path& folder) {
    std::error_code ignored;
    return std::filesystem::is_regular_file(folder / SESSION_FILE, ignored);
}

/** @return false if there is no such file, or one that is too long to be part of a recording */
bool readFile(const path& file, std::string& bytes) {
    std::error_code failure;
    const std::uintmax_t size = std::filesystem::file_size(file, failure);
    if (failure || size > FILE_BYTES_MAX) {
        return false;
    }
    std::ifstream in(file, std::ios::binary);
    bytes.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    return !in.bad();
}

/** Null where the text is no JSON. What is nested deeper than any line is left out. */
Json parse(const std::string& text) {
    const auto refuseDepth = [](int depth, Json::parse_event_t /*event*/, Json& /*value*/) {
        return depth <= DEPTH_MAX;
    };
    const Json value = Json::parse(text, refuseDepth, false);
    return value.is_discarded() ? Json() : value;
}

bool isEvent(const Json& line) {
    return line.is_object() && line.contains("t") && line["t"].is_number_integer() &&
           line.contains("kind") && line["kind"].is_string();
}

/** The end of a recording, which need not have a time. */
bool isEnd(const Json& line) {
    return line.is_object() && textOf(line, "kind") == "end";
}

void readLines(Recording& recording) {
    std::string text;
    if (!readFile(path(recording.folder) / "events.jsonl", text)) {
        recording.remarks.emplace_back("There is no events.jsonl that can be read.");
        return;
    }
    std::size_t unreadable = 0;
    bool hasEnd = false;
    std::size_t begin = 0;
    for (std::size_t end = text.find('\n'); end != std::string::npos;
         begin = end + 1, end = text.find('\n', begin)) {
        Json line = parse(text.substr(begin, end - begin));
        hasEnd = hasEnd || isEnd(line);
        if (isEvent(line)) {
            recording.lines.push_back(std::move(line));
        } else if (!isEnd(line)) {
            ++unreadable;
        }
    }
    if (begin < text.size()) {
        recording.remarks.emplace_back("The last line of events.jsonl is cut off.");
    }
    if (unreadable > 0) {
        recording.remarks.push_back(std::to_string(unreadable) +
                                    " lines of events.jsonl cannot be read.");
    }
    if (!hasEnd) {
        recording.remarks.emplace_back("The recording has no end: its process was killed.");
    }
    // Lines of different threads may be out of order.
    std::stable_sort(recording.lines.begin(), recording.lines.end(),
                     [](const Json& one, const Json& other) {
                         return numberOf(one, "t") < numberOf(other, "t");
                     });
}

void readSound(Recording& recording) {
    const int64_t rate = numberOf(recording.session, "sampleRate");
    if (recording.session.value("hasSound", Json(true)) == Json(false)) {
        recording.remarks.emplace_back("The sound was not recorded.");
        return;
    }
    std::string bytes;
    if (rate < RATE_MIN || rate > RATE_MAX ||
        !readFile(path(recording.folder) / "sound.wav", bytes) || bytes.size() < WAV_HEAD_BYTES ||
        bytes.compare(0, 4, "RIFF") != 0) {
        recording.remarks.emplace_back("There is no sound.wav that can be read.");
        return;
    }
    // The lengths in the header are those of a recording that was ended in order.
    recording.sampleRateHz = static_cast<int>(rate);
    recording.samples.reserve((bytes.size() - WAV_HEAD_BYTES) / 2);
    for (std::size_t at = WAV_HEAD_BYTES; at + 1 < bytes.size(); at += 2) {
        const auto low = static_cast<unsigned char>(bytes[at]);
        const auto high = static_cast<unsigned char>(bytes[at + 1]);
        recording.samples.push_back(static_cast<int16_t>(low | high << 8U));
    }
}

}  // namespace

std::string textOf(const Json& object, const char* name) {
    const auto found = object.find(name);
    return found != object.end() && found->is_string() ? found->get<std::string>() : std::string();
}

int64_t numberOf(const Json& object, const char* name, int64_t fallback) {
    const auto found = object.find(name);
    if (found == object.end() || !found->is_number_integer()) {
        return fallback;
    }
    const double value = found->get<double>();
    return value < -NUMBER_MAX || value > NUMBER_MAX ? fallback : found->get<int64_t>();
}

Recording::Recording(const std::string& recordedFolder) : folder(recordedFolder) {
    std::string text;
    if (!isRecording(folder) || !readFile(path(folder) / SESSION_FILE, text)) {
        throw UsageError(folder + " is no recording: it has no " + SESSION_FILE +
                         " that can be read");
    }
    session = parse(text);
    if (!session.is_object()) {
        throw UsageError(folder + " is no recording: its " + SESSION_FILE + " is no JSON object");
    }
    const int64_t format = numberOf(session, "format");
    if (format < 1) {
        throw UsageError(folder + " is no recording: its " + SESSION_FILE + " names no format");
    }
    if (format > RECORDING_FORMAT) {
        throw UsageError(folder + " was recorded in format " + std::to_string(format) +
                         "; this tool reads format " + std::to_string(RECORDING_FORMAT));
    }
    readLines(*this);
    readSound(*this);
}

std::vector<std::string> findRecordings(const std::vector<std::string>& folders) {
    std::vector<std::string> found;
    for (const std::string& folder : folders) {
        if (isRecording(folder)) {
            found.push_back(folder);
            continue;
        }
        std::vector<std::string> inside;
        std::error_code failure;
        for (const auto& entry : std::filesystem::directory_iterator(folder, failure)) {
            if (isRecording(entry.path())) {
                inside.push_back(entry.path().string());
            }
        }
        if (inside.empty()) {
            throw UsageError(folder + " is no recording, and there is none in it");
        }
        std::sort(inside.begin(), inside.end());
        found.insert(found.end(), inside.begin(), inside.end());
    }
    return found;
}

}  // namespace Cli
