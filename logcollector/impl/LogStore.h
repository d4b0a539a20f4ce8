/**
 * @file
 * Keeps usage records in files, so that they outlive the process.
 */
#pragma once

#include <cstdint>
#include <list>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "logcollector/LogStoreOptions.h"
#include "logcollector/impl/StoreFile.h"
#include "logcollector/impl/StoreFormat.h"

namespace LogCollector {

/** A record that waits for its delivery or is on its way. */
struct LogRecord {
    std::string text;
    uint64_t ticket = 0; /**< names it in the store; 0 where it is in memory only */
};

/**
 * A journal in segments; StoreFormat.h has their bytes. `add` appends to the newest segment, at
 * most 1/16 of the bound in size and in age. A record that leaves is marked in its place; a segment
 * without records left is removed, or cut to its head if it is the newest. So nothing is ever
 * written twice, no operation takes longer for a long journal, and each takes effect with one call
 * of the system. A process that is killed within such a call may leave a part of a record where the
 * file goes from one page of memory to the next; the check sums show it, and the record was not yet
 * safe.
 *
 * Safe means in the hands of the system: the death of the process costs nothing. Nothing waits for
 * the disk itself (no fsync): a power failure may cost what the system has not written by then, and
 * the check sums keep torn records from being taken for whole ones.
 *
 * The bounds are the caller's business: `isFull` and `isExpired` say when the oldest segment has to
 * go. Not synchronised. Where the disk refuses, an operation says so in the log, once until it
 * works again, and the record stays in memory alone.
 */
class LogStore {
  public:
    static const std::string TAG;

    /** What an earlier process left. */
    struct Rest {
        std::list<LogRecord> records; /**< not delivered, in the order in which they were logged */
        uint64_t noticeTicket = 0;    /**< which of them is the latest notice; 0 for none */
        uint64_t noticeLost = 0;      /**< and how many it tells of */
    };

    /**
     * Locks the folder and reads what is there; damaged parts are left out, with a line in the log.
     * @return null when the folder cannot be used; the log says why
     */
    static std::unique_ptr<LogStore> open(const LogStoreOptions& options, Rest& rest);

    LogStore(const LogStore&) = delete;
    LogStore& operator=(const LogStore&) = delete;

    static uint32_t segmentOf(uint64_t ticket) { return static_cast<uint32_t>(ticket >> 32U); }

    /** Stores a record, whatever the bounds are. @return its ticket, 0 when the disk refuses */
    uint64_t add(std::string_view text);

    /** Stores a notice. From then on what it replaces is dropped, come what may. */
    uint64_t addNotice(std::string_view text, const StoreFormat::Notice& notice);

    /** Takes a record out that has been delivered; for 0 and unknown tickets nothing happens. */
    void remove(uint64_t ticket);

    /** Removes a segment with all that is in it. */
    void drop(uint32_t segment);

    /** True when the bound leaves no room for a record of this size and a notice. */
    bool isFull(std::size_t textBytes) const;

    /** True when the oldest segment has records, all of them beyond the age. */
    bool isExpired() const;

    /** True when a record of this size could never be stored. */
    bool isTooLarge(std::size_t textBytes) const;

    bool has(uint32_t segment) const { return segments.count(segment) > 0; }
    std::size_t getSegmentCount() const { return segments.size(); }

    /** The number of the oldest segment, 0 without any. */
    uint32_t getOldest() const { return segments.empty() ? 0 : segments.begin()->first; }

    /** Has the next record begin a segment. @return false when the disk refuses */
    bool startSegment();

  private:
    struct Segment {
        std::size_t size = 0;
        std::size_t live = 0;
        int64_t oldest = 0; /**< seconds since 1970 */
        int64_t newest = 0;
    };
    using Loaded = std::vector<std::pair<uint64_t, StoreFormat::Frame>>;

    explicit LogStore(const LogStoreOptions& storeOptions);

    std::string pathOf(uint32_t segment) const;
    bool occupy();
    bool load(Rest& rest);
    void loadSegment(uint32_t number, std::size_t size, const StoreFormat::Segment& read,
                     Loaded& loaded);
    void finishDrops(Loaded& loaded);
    void resume(bool isSound);
    void refuse(const std::string& reason) const;

    std::size_t sizeOfSegment() const;
    bool needsSegment(int64_t time) const;
    uint64_t append(const StoreFormat::Notice* notice, std::string_view text);
    void mark(uint64_t ticket);
    void onFailure(const char* what);

    const LogStoreOptions options;
    StoreFile lockFile;
    std::map<uint32_t, Segment> segments;
    StoreFile current;      /**< the newest segment's, open while records are appended to it */
    uint32_t last = 0;      /**< the highest number so far */
    std::size_t bytes = 0;  /**< of all segments */
    int64_t newestTime = 0; /**< times never go back, so that a clock that does ages nothing */
    bool isFailing = false;
    std::string buffer;
};

}  // namespace LogCollector
