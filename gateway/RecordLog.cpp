#include "gateway/RecordLog.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>

#include "pal/kd_log.h"
#include "pal/kd_time.h"

namespace Gateway {

namespace {

constexpr int TM_YEAR_0 = 1900;
constexpr mode_t FILE_MODE = 0644;

std::string timeText() {
    const KDtime now = kdTime(nullptr);
    KDTm fields{};
    kdGmtime_r(&now, &fields);
    char text[64];
    kdSprintf_s(text, sizeof(text), "%04d-%02d-%02dT%02d:%02d:%02dZ", fields.tm_year + TM_YEAR_0,
                fields.tm_mon + 1, fields.tm_mday, fields.tm_hour, fields.tm_min, fields.tm_sec);
    return text;
}

void appendEscaped(std::string& line, const std::string& text, unsigned firstPrintable) {
    for (const char c : text) {
        const unsigned code = static_cast<unsigned char>(c);
        if (code < firstPrintable || code == 0x7f || c == '\\') {
            char escaped[8];
            kdSprintf_s(escaped, sizeof(escaped), "\\x%02x", code);
            line += escaped;
        } else {
            line += c;
        }
    }
}

bool isOnDisk(int file) {
    struct stat status {};
    return ::fstat(file, &status) == 0 && S_ISREG(status.st_mode);
}

}  // namespace

RecordLog::~RecordLog() {
    close();
}

std::string RecordLog::open(const std::string& path) {
    file = path.empty()
               ? ::fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 0)
               : ::open(path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, FILE_MODE);
    if (file < 0) {
        return "cannot write the log of records " + path + ": " + std::strerror(errno);
    }
    if (isOnDisk(file)) {
        syncer = std::thread([this] { syncAsLinesCome(); });
    }
    return std::string();
}

void RecordLog::close() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        closing = true;
        changed.notify_one();
    }
    if (syncer.joinable()) {
        syncer.join();
    }
    const std::lock_guard<std::mutex> lock(mutex);
    if (file >= 0) {
        ::close(file);
        file = -1;
    }
}

bool RecordLog::append(const std::string& uuid, const std::string& record) {
    std::string line = timeText() + " uuid=";
    appendEscaped(line, uuid, '!');
    line += ' ';
    appendEscaped(line, record, ' ');
    line += '\n';

    const std::lock_guard<std::mutex> lock(mutex);
    if (tornLine) {
        line.insert(0, "\n");
    }
    const bool written = file >= 0 && write(line);
    if (written) {
        ++unsyncedLines;
        changed.notify_one();
    }
    return written;
}

bool RecordLog::write(const std::string& line) {
    std::size_t done = 0;
    while (done < line.size()) {
        const ssize_t count = ::write(file, line.data() + done, line.size() - done);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            kdLogFormatMessage("cannot write a record: %s", std::strerror(errno));
            tornLine = tornLine || done > 0;
            return false;
        }
        done += static_cast<std::size_t>(count);
    }
    tornLine = false;
    return true;
}

std::size_t RecordLog::getSyncCount() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return syncs;
}

void RecordLog::syncAsLinesCome() {
    std::unique_lock<std::mutex> lock(mutex);
    for (;;) {
        changed.wait(lock, [this] { return closing || unsyncedLines > 0; });
        if (unsyncedLines == 0) {
            return;
        }
        unsyncedLines = 0;
        lock.unlock();
        const bool synced = ::fsync(file) == 0;
        if (!synced) {
            kdLogFormatMessage("cannot sync the log of records: %s", std::strerror(errno));
        }
        lock.lock();
        ++syncs;
    }
}

}  // namespace Gateway
