#include "talvox/impl/recording/RecordingFolders.h"

#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <string_view>
#include <utility>
#include <vector>

#include "pal/kd_log.h"
#include "pal/kd_time.h"

namespace Talvox {

namespace {

constexpr mode_t FOR_THE_USER_ONLY = 0700;
constexpr int MOST_NAMES = 10000;
constexpr const char* FILES[] = {"session.json", "events.jsonl", "sound.wav"};

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/** Whether a name has the form 20261122-051057-4711-0001, with any number of digits in each part.
 */
bool isRecordingName(std::string_view name) {
    constexpr std::size_t DATE_DIGITS = 8;
    int hyphens = 0;
    for (std::size_t i = 0; i < name.size(); ++i) {
        if (name[i] == '-' && i >= DATE_DIGITS && isDigit(name[i - 1])) {
            ++hyphens;
        } else if (!isDigit(name[i])) {
            return false;
        }
    }
    return hyphens == 3 && isDigit(name.back()) && name[DATE_DIGITS] == '-';
}

int64_t measure(const std::string& folder) {
    int64_t size = 0;
    for (const char* const file : FILES) {
        struct stat status = {};
        if (::lstat((folder + "/" + file).c_str(), &status) == 0) {
            size += status.st_size;
        }
    }
    return size;
}

/** Removes the files of a recording, and the folder unless somebody has put more into it. */
void removeRecording(const std::string& folder) {
    for (const char* const file : FILES) {
        ::unlink((folder + "/" + file).c_str());
    }
    ::rmdir(folder.c_str());
}

std::vector<std::string> listRecordings(const std::string& root) {
    std::vector<std::string> names;
    DIR* const directory = ::opendir(root.c_str());
    if (directory == nullptr) {
        return names;
    }
    while (const dirent* const entry = ::readdir(directory)) {
        if (isRecordingName(entry->d_name)) {
            names.emplace_back(entry->d_name);
        }
    }
    ::closedir(directory);
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace

RecordingFolders::RecordingFolders(std::string rootFolder, int64_t maxBytes)
    : root(std::move(rootFolder)), bound(maxBytes) {}

bool RecordingFolders::prepare() const {
    const bool isMade = ::mkdir(root.c_str(), FOR_THE_USER_ONLY) == 0;
    struct stat status = {};
    if (!isMade && (::stat(root.c_str(), &status) != 0 || !S_ISDIR(status.st_mode))) {
        kdLogFormatMessage("SessionRecording: %s cannot be used: %s", root.c_str(),
                           std::strerror(S_ISREG(status.st_mode) ? ENOTDIR : errno));
        return false;
    }
    if (::access(root.c_str(), W_OK | X_OK) != 0) {
        kdLogFormatMessage("SessionRecording: %s cannot be used: %s", root.c_str(),
                           std::strerror(errno));
        return false;
    }
    return true;
}

std::string RecordingFolders::makeFolder(int64_t calendarTime) {
    const KDtime seconds = calendarTime;
    KDTm utc = {};
    kdGmtime_r(&seconds, &utc);
    list();
    for (int attempt = 0; attempt < MOST_NAMES; ++attempt) {
        std::array<char, 96> name{};
        kdSprintf_s(name.data(), name.size(), "/%04d%02d%02d-%02d%02d%02d-%d-%04d",
                    utc.tm_year + 1900, utc.tm_mon + 1, utc.tm_mday, utc.tm_hour, utc.tm_min,
                    utc.tm_sec, static_cast<int>(::getpid()), ++made);
        std::string path = root + name.data();
        if (::mkdir(path.c_str(), FOR_THE_USER_ONLY) == 0) {
            return path;
        }
        if (errno != EEXIST) {
            break;
        }
    }
    kdLogFormatMessage("SessionRecording: no folder can be made in %s: %s", root.c_str(),
                       std::strerror(errno));
    return "";
}

void RecordingFolders::list() {
    entries.clear();
    entriesSize = 0;
    for (const std::string& name : listRecordings(root)) {
        const std::string path = root + "/" + name;
        entries.push_back({path, measure(path)});
        entriesSize += entries.back().size;
    }
}

bool RecordingFolders::makeRoom(int64_t size) {
    while (!entries.empty() && entriesSize + size > bound) {
        removeRecording(entries.front().path);
        entriesSize -= entries.front().size;
        entries.pop_front();
    }
    return size <= bound;
}

}  // namespace Talvox
