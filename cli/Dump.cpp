#include "Dump.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <optional>

#include "LogOutput.h"
#include "Text.h"
#include "UsageError.h"
#include "WavHead.h"
#include "pal/kd_file.h"

namespace Cli {

namespace {

// The root below which a session writes.
const char* const DUMP_ROOT = "/removable";
// "write: error in write", "close: error in close" and the like.
const char* const WRITE_FAILURE = ": error in ";
const mode_t FILE_MODE = 0666;

[[noreturn]] void refuse(const std::string& path, const std::string& reason) {
    throw UsageError("cannot write to " + printable(path) + ": " + reason);
}

void checkDirectory(const std::string& path) {
    struct stat status = {};
    if (stat(path.c_str(), &status) != 0) {
        refuse(path, std::strerror(errno));
    }
    if (!S_ISDIR(status.st_mode)) {
        refuse(path, "it is not a directory");
    }
}

void checkFile(const std::string& path) {
    int file = open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, FILE_MODE);
    const bool isNew = file >= 0;
    if (!isNew && errno == EEXIST) {
        file = open(path.c_str(), O_WRONLY | O_NONBLOCK | O_CLOEXEC);
    }
    if (file < 0) {
        refuse(path, std::strerror(errno));
    }
    close(file);
    if (isNew) {
        unlink(path.c_str());
    }
}

}  // namespace

Dump::Dump(const std::string& directory) : directoryPath(directory), path(directory + "/in.wav") {
    checkDirectory(directoryPath);
    checkFile(path);
}

void Dump::begin(LogOutput& log) const {
    log.watchFor(WRITE_FAILURE);
    // What an earlier session left must not pass for this one's.
    std::ofstream(path, std::ios::binary | std::ios::trunc).close();
    kdMountKOR(DUMP_ROOT, directoryPath.c_str());
}

bool Dump::isComplete(LogOutput& log) const {
    if (log.hasSeenWatched()) {
        return false;
    }
    std::ifstream file(path, std::ios::binary);
    const std::optional<WavHead> head = readWavHead(file);
    file.clear();
    file.seekg(0, std::ios::end);
    return head && head->soundOffset + head->soundBytes == static_cast<std::uint64_t>(file.tellg());
}

}  // namespace Cli
