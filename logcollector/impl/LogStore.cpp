#include "logcollector/impl/LogStore.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <limits>
#include <new>
#include <utility>

#include "core/Logger.h"
#include "pal/kd_time.h"

namespace LogCollector {

namespace {

using StoreFormat::Frame;
using StoreFormat::Kind;
using StoreFormat::Notice;

constexpr int64_t PARTS = 16;  // of a bound, one for each segment
constexpr std::size_t NOTICE_ROOM = 256;
constexpr mode_t FOR_THE_USER_ONLY = 0700;
constexpr uint32_t MOST_SEGMENTS = 4000000000;  // in the life of a folder
constexpr std::size_t MOST_BYTES_READ = std::numeric_limits<uint32_t>::max();

std::string lastError() {
    return std::strerror(errno);
}

int64_t repair(const char* name, int64_t value, int64_t least, int64_t most) {
    const int64_t repaired = std::clamp(value, least, most);
    if (repaired != value) {
        Logger::log(Logger::PROBLEM, "%s: %s %" PRId64 " is out of range, %" PRId64 " is used",
                    LogStore::TAG.c_str(), name, value, repaired);
    }
    return repaired;
}

LogStoreOptions repair(LogStoreOptions options) {
    options.maxBytes = repair("maxBytes", options.maxBytes, LogStoreOptions::MAX_BYTES_LEAST,
                              LogStoreOptions::MAX_BYTES_MOST);
    options.maxAgeS = repair("maxAgeS", options.maxAgeS, LogStoreOptions::MAX_AGE_S_LEAST,
                             LogStoreOptions::MAX_AGE_S_MOST);
    return options;
}

std::string nameOf(uint32_t segment) {
    char name[32];
    std::snprintf(name, sizeof(name), "records-%010" PRIu32, segment);
    return name;
}

/** @return 0 for what is no segment's name */
uint32_t numberIn(const std::string& name) {
    uint32_t number = 0;
    const bool isNumber = std::sscanf(name.c_str(), "records-%10" SCNu32, &number) == 1;
    return isNumber && number <= MOST_SEGMENTS && name == nameOf(number) ? number : 0;
}

/** The numbers of the segments in a folder, in their order; false when it cannot be read. */
bool listSegments(const std::string& folder, std::vector<uint32_t>& numbers) {
    DIR* const directory = ::opendir(folder.c_str());
    if (directory == nullptr) {
        return false;
    }
    while (const dirent* entry = ::readdir(directory)) {
        if (const uint32_t number = numberIn(entry->d_name); number > 0) {
            numbers.push_back(number);
        }
    }
    ::closedir(directory);
    std::sort(numbers.begin(), numbers.end());
    return true;
}

uint64_t makeTicket(uint32_t segment, uint32_t offset) {
    return uint64_t{segment} << 32U | offset;
}

uint32_t offsetOf(uint64_t ticket) {
    return static_cast<uint32_t>(ticket);
}

}  // namespace

const std::string LogStore::TAG("LogStore");

LogStore::LogStore(const LogStoreOptions& storeOptions) : options(repair(storeOptions)) {}

std::unique_ptr<LogStore> LogStore::open(const LogStoreOptions& options, Rest& rest) {
    std::unique_ptr<LogStore> store(new LogStore(options));
    try {
        if (store->occupy() && store->load(rest)) {
            return store;
        }
    } catch (const std::bad_alloc&) {
        store->refuse("out of memory");
    }
    rest = Rest();
    return nullptr;
}

void LogStore::refuse(const std::string& reason) const {
    Logger::log(Logger::PROBLEM, "%s: %s is not used, records are in memory only: %s", TAG.c_str(),
                options.folder.c_str(), reason.c_str());
}

std::string LogStore::pathOf(uint32_t segment) const {
    return options.folder + "/" + nameOf(segment);
}

bool LogStore::occupy() {
    if (::mkdir(options.folder.c_str(), FOR_THE_USER_ONLY) != 0 && errno != EEXIST) {
        refuse(lastError());
        return false;
    }
    lockFile = StoreFile(options.folder + "/lock", O_RDWR | O_CREAT);
    // Where nothing could be removed, every start would deliver the same records again.
    if (!lockFile.isOpen() || ::access(options.folder.c_str(), R_OK | W_OK | X_OK) != 0) {
        refuse(lastError());
        return false;
    }
    if (!lockFile.lock()) {
        refuse(errno == EWOULDBLOCK ? "another process uses it" : lastError());
        return false;
    }
    return true;
}

bool LogStore::load(Rest& rest) {
    std::vector<uint32_t> numbers;
    if (!listSegments(options.folder, numbers)) {
        refuse(lastError());
        return false;
    }
    // The frames point into the files' bytes.
    std::list<std::string> files;
    Loaded loaded;
    bool isSound = false;
    for (const uint32_t number : numbers) {
        last = number;
        std::optional<std::string> read = StoreFile::read(pathOf(number), MOST_BYTES_READ);
        if (!read) {
            Logger::log(Logger::PROBLEM, "%s: %s cannot be read, it is left alone: %s", TAG.c_str(),
                        pathOf(number).c_str(), lastError().c_str());
            continue;
        }
        files.push_back(std::move(*read));
        const StoreFormat::Segment segment = StoreFormat::read(files.back(), number);
        if (segment.head == StoreFormat::Segment::Head::NEWER) {
            refuse(pathOf(number) + " has the format of a later version");
            return false;
        }
        isSound = segment.isSound();
        loadSegment(number, files.back().size(), segment, loaded);
    }
    finishDrops(loaded);
    for (const auto& [ticket, frame] : loaded) {
        rest.records.push_back({std::string(frame.text), ticket});
        if (frame.notice.lost > 0) {
            rest.noticeTicket = ticket;
            rest.noticeLost = frame.notice.lost;
        }
    }
    resume(isSound);
    return true;
}

void LogStore::loadSegment(uint32_t number, std::size_t size, const StoreFormat::Segment& read,
                           Loaded& loaded) {
    // A process that ends before it writes the head leaves an empty file; it had nothing in it.
    if (size > 0 && !read.isSound()) {
        Logger::log(Logger::PROBLEM,
                    "%s: %s is damaged: %s%zu bytes are no record, %zu marks cannot be read, %zu "
                    "records are whole",
                    TAG.c_str(), pathOf(number).c_str(),
                    read.head == StoreFormat::Segment::Head::GOOD ? "" : "no head, ", read.badBytes,
                    read.badMarks, read.frames.size());
    }
    Segment& segment = segments[number];
    segment.size = size;
    bytes += size;
    for (const Frame& frame : read.frames) {
        segment.oldest = segment.newest == 0 ? frame.time : std::min(segment.oldest, frame.time);
        segment.newest = std::max(segment.newest, frame.time);
        if (!frame.isDone) {
            ++segment.live;
            loaded.emplace_back(makeTicket(number, frame.offset), frame);
        }
    }
    newestTime = std::max(newestTime, segment.newest);
}

// A process that ended between a notice and what has to follow it.
void LogStore::finishDrops(Loaded& loaded) {
    std::vector<Notice> notices;
    for (const auto& entry : loaded) {
        if (entry.second.kind == Kind::NOTICE) {
            notices.push_back(entry.second.notice);
        }
    }
    for (const Notice& notice : notices) {
        const auto isGone = [&notice](const Loaded::value_type& entry) {
            return entry.first == notice.replaces || segmentOf(entry.first) == notice.dropped;
        };
        const bool isReplaced = std::any_of(
            loaded.begin(), loaded.end(),
            [&notice](const Loaded::value_type& entry) { return entry.first == notice.replaces; });
        loaded.erase(std::remove_if(loaded.begin(), loaded.end(), isGone), loaded.end());
        if (isReplaced) {
            remove(notice.replaces);
        }
        drop(notice.dropped);
    }
}

void LogStore::resume(bool isSound) {
    for (auto it = segments.begin(); it != segments.end();) {
        const auto segment = it++;
        if (segment->second.live == 0) {
            drop(segment->first);
        }
    }
    if (isSound && has(last) && segments.at(last).size < sizeOfSegment()) {
        current = StoreFile(pathOf(last), O_RDWR);
    }
}

std::size_t LogStore::sizeOfSegment() const {
    return static_cast<std::size_t>(options.maxBytes / PARTS);
}

bool LogStore::isFull(std::size_t textBytes) const {
    return bytes + StoreFormat::HEAD_BYTES + StoreFormat::frameBytes(textBytes) + NOTICE_ROOM >
           static_cast<std::size_t>(options.maxBytes);
}

bool LogStore::isTooLarge(std::size_t textBytes) const {
    return StoreFormat::HEAD_BYTES + StoreFormat::frameBytes(textBytes) + 2 * NOTICE_ROOM >
           static_cast<std::size_t>(options.maxBytes);
}

bool LogStore::isExpired() const {
    if (segments.empty() || segments.begin()->second.live == 0) {
        return false;
    }
    return kdTime(nullptr) - segments.begin()->second.newest > options.maxAgeS;
}

bool LogStore::needsSegment(int64_t time) const {
    if (!current.isOpen()) {
        return true;
    }
    const Segment& segment = segments.at(last);
    return segment.live > 0 &&
           (segment.size >= sizeOfSegment() || time - segment.oldest > options.maxAgeS / PARTS);
}

bool LogStore::startSegment() {
    const uint32_t number = last + 1;
    StoreFile file(pathOf(number), O_RDWR | O_CREAT | O_EXCL);
    if (!file.isOpen()) {
        onFailure("no file can be made");
        return false;
    }
    if (!file.write(StoreFormat::makeHead(number), 0)) {
        onFailure("no file can be written");
        ::unlink(pathOf(number).c_str());
        return false;
    }
    const uint32_t before = last;
    current = std::move(file);
    last = number;
    segments[number].size = StoreFormat::HEAD_BYTES;
    bytes += StoreFormat::HEAD_BYTES;
    if (has(before) && segments.at(before).live == 0) {
        drop(before);
    }
    return true;
}

uint64_t LogStore::add(std::string_view text) {
    return append(nullptr, text);
}

uint64_t LogStore::addNotice(std::string_view text, const Notice& notice) {
    return append(&notice, text);
}

uint64_t LogStore::append(const Notice* notice, std::string_view text) {
    newestTime = std::max<int64_t>(newestTime, kdTime(nullptr));
    if (needsSegment(newestTime) && !startSegment()) {
        return 0;
    }
    Segment& segment = segments.at(last);
    const auto offset = static_cast<uint32_t>(segment.size);
    if (notice == nullptr) {
        StoreFormat::makeFrame(buffer, last, offset, newestTime, text);
    } else {
        StoreFormat::makeFrame(buffer, last, offset, newestTime, text, *notice);
    }
    if (!current.write(buffer, offset)) {
        onFailure("a record cannot be written");
        current.truncate(offset);
        return 0;
    }
    if (std::exchange(isFailing, false)) {
        Logger::log(Logger::PROBLEM, "%s: %s takes records again", TAG.c_str(),
                    options.folder.c_str());
    }
    segment.oldest = segment.live == 0 ? newestTime : segment.oldest;
    segment.newest = newestTime;
    segment.size += buffer.size();
    bytes += buffer.size();
    ++segment.live;
    return makeTicket(last, offset);
}

void LogStore::onFailure(const char* what) {
    const std::string reason = lastError();
    if (!std::exchange(isFailing, true)) {
        Logger::log(Logger::PROBLEM, "%s: %s: %s: %s; records are in memory only until it can",
                    TAG.c_str(), options.folder.c_str(), what, reason.c_str());
    }
}

void LogStore::remove(uint64_t ticket) {
    const auto found = segments.find(segmentOf(ticket));
    if (found == segments.end() || found->second.live == 0) {
        return;
    }
    const bool isLast = --found->second.live == 0;
    const bool isCurrent = found->first == last && current.isOpen();
    if (isLast && !isCurrent) {
        drop(found->first);
    } else if (isLast && current.truncate(StoreFormat::HEAD_BYTES)) {
        bytes -= found->second.size - StoreFormat::HEAD_BYTES;
        found->second.size = StoreFormat::HEAD_BYTES;
    } else {
        mark(ticket);
    }
}

// A mark that cannot be set costs one more delivery, after the next start.
void LogStore::mark(uint64_t ticket) {
    const uint32_t segment = segmentOf(ticket);
    const bool isCurrent = segment == last && current.isOpen();
    const StoreFile other = isCurrent ? StoreFile() : StoreFile(pathOf(segment), O_RDWR);
    const StoreFile& file = isCurrent ? current : other;
    if (!file.isOpen() || !file.write(StoreFormat::makeMark(), offsetOf(ticket))) {
        Logger::log(Logger::PROBLEM,
                    "%s: %s: a delivered record cannot be marked and may be sent again: %s",
                    TAG.c_str(), pathOf(segment).c_str(), lastError().c_str());
    }
}

void LogStore::drop(uint32_t segment) {
    const auto found = segments.find(segment);
    if (found == segments.end()) {
        return;
    }
    if (segment == last) {
        current = StoreFile();
    }
    bytes -= found->second.size;
    segments.erase(found);
    if (::unlink(pathOf(segment).c_str()) != 0) {
        Logger::log(Logger::PROBLEM, "%s: %s cannot be removed, its records may be sent again: %s",
                    TAG.c_str(), pathOf(segment).c_str(), lastError().c_str());
    }
}

}  // namespace LogCollector
