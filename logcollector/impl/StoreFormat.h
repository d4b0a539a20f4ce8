/**
 * @file
 * The bytes of a store's files; no input or output here.
 *
 * A store is a row of segments, files with ascending numbers. A segment is a head and then frames,
 * one per record, without gaps. All numbers are little-endian.
 *
 *     head, 16 bytes:
 *       8  magic
 *       4  version
 *       4  check sum of these 12 bytes and the number of the segment
 *
 *     front of a frame, 28 bytes:
 *       4  mark: 0, or DONE when the record has left the store
 *       4  check sum of the next 20 bytes, the number of the segment and the offset of the frame
 *       4  kind
 *       4  size of the payload
 *       8  time in seconds since 1970
 *       4  check sum of the payload, which follows
 *
 * Frames are appended and never change, but for the mark, which one write of four bytes sets. Of a
 * damaged mark the record counts as not yet delivered. After any other damage the reader looks for
 * the next sound frame, byte by byte. Number and offset are part of the check sum, so that bytes
 * are a frame only where they were written.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace LogCollector::StoreFormat {

constexpr std::size_t HEAD_BYTES = 16;
constexpr std::size_t FRONT_BYTES = 28;  // of a frame
constexpr uint32_t VERSION = 1;
constexpr uint32_t DONE = 0x454E4F44;

enum class Kind : uint32_t {
    RECORD = 1,
    NOTICE = 2 /**< a record that stands for others; see `Notice` */
};

/**
 * What precedes the text in the payload of a notice. With its frame the others leave the store, in
 * one step; a process that ends before they are marked has the next one do it.
 */
struct Notice {
    uint64_t lost = 0;    /**< how many dropped records the text tells of; 0: a record that moved */
    uint32_t dropped = 0; /**< the segment that leaves; 0 for none */
    uint64_t replaces = 0; /**< the ticket of the record that leaves; 0 for none */
};

/** A frame in the bytes that were read. */
struct Frame {
    uint32_t offset = 0;
    Kind kind = Kind::RECORD;
    bool isDone = false;
    int64_t time = 0;
    std::string_view text;
    Notice notice;
};

/** What a segment holds. */
struct Segment {
    enum class Head {
        GOOD,
        DAMAGED, /**< the frames are read all the same */
        NEWER    /**< a later version of the format; no frames are read */
    };

    Head head = Head::GOOD;
    std::vector<Frame> frames; /**< sound ones, in their order */
    std::size_t badBytes = 0;  /**< that belong to no sound frame; marks and head not counted */
    std::size_t badMarks = 0;  /**< sound frames whose mark is damaged */

    bool isSound() const { return head == Head::GOOD && badBytes == 0 && badMarks == 0; }
};

std::string makeHead(uint32_t segment);

std::string makeMark();

/** Replaces `frame` by the bytes of a frame at `offset` of a segment. */
void makeFrame(std::string& frame, uint32_t segment, uint32_t offset, int64_t time,
               std::string_view text);
void makeFrame(std::string& frame, uint32_t segment, uint32_t offset, int64_t time,
               std::string_view text, const Notice& notice);

/** How many bytes a frame with this text has at most. */
std::size_t frameBytes(std::size_t textBytes);

/** Reads any bytes, up to 4 GiB of them. The frames point into `bytes`. */
Segment read(std::string_view bytes, uint32_t segment);

}  // namespace LogCollector::StoreFormat
