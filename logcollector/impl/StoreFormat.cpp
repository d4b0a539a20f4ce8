#include "logcollector/impl/StoreFormat.h"

#include <algorithm>
#include <optional>
#include <utility>

#include "logcollector/impl/Crc32.h"

namespace LogCollector::StoreFormat {

namespace {

const std::string_view MAGIC("TvUsage\n", 8);
constexpr std::size_t MARK_BYTES = 4;
constexpr std::size_t NOTICE_BYTES = 20;
constexpr std::size_t SUMMED_FROM = 8;  // in a frame's front

template <class Number>
void put(std::string& bytes, Number number) {
    for (std::size_t i = 0; i < sizeof(number); ++i) {
        bytes += static_cast<char>(static_cast<uint64_t>(number) >> 8 * i & 0xFFU);
    }
}

template <class Number>
Number get(std::string_view bytes, std::size_t offset) {
    uint64_t number = 0;
    for (std::size_t i = sizeof(Number); i > 0; --i) {
        number = number << 8U | static_cast<unsigned char>(bytes[offset + i - 1]);
    }
    return static_cast<Number>(number);
}

uint32_t sumOfHead(std::string_view bytes, uint32_t segment) {
    std::string place;
    put(place, segment);
    return crc32({bytes.substr(0, HEAD_BYTES - sizeof(uint32_t)), place});
}

uint32_t sumOfFront(std::string_view front, uint32_t segment, uint32_t offset) {
    std::string place;
    put(place, segment);
    put(place, offset);
    return crc32({front.substr(SUMMED_FROM, FRONT_BYTES - SUMMED_FROM), place});
}

/** Makes a frame of the payload that follows the room for its front. */
void fillFront(std::string& frame, Kind kind, uint32_t segment, uint32_t offset, int64_t time) {
    const std::string_view payload = std::string_view(frame).substr(FRONT_BYTES);
    std::string front;
    put(front, uint32_t{0});
    put(front, uint32_t{0});
    put(front, static_cast<uint32_t>(kind));
    put(front, static_cast<uint32_t>(payload.size()));
    put(front, time);
    put(front, crc32({payload}));
    std::string sum;
    put(sum, sumOfFront(front, segment, offset));
    front.replace(MARK_BYTES, sum.size(), sum);
    frame.replace(0, FRONT_BYTES, front);
}

Segment::Head readHead(std::string_view bytes, uint32_t segment) {
    if (bytes.size() < HEAD_BYTES || bytes.substr(0, MAGIC.size()) != MAGIC ||
        get<uint32_t>(bytes, HEAD_BYTES - 4) != sumOfHead(bytes, segment)) {
        return Segment::Head::DAMAGED;
    }
    return get<uint32_t>(bytes, MAGIC.size()) == VERSION ? Segment::Head::GOOD
                                                         : Segment::Head::NEWER;
}

/** Walks over the bytes of a segment. */
class Reader {
  public:
    Reader(std::string_view source, uint32_t ofSegment) : bytes(source), number(ofSegment) {}

    Segment read() {
        segment.head = readHead(bytes, number);
        if (segment.head != Segment::Head::NEWER) {
            std::size_t offset = HEAD_BYTES;
            while (offset < bytes.size()) {
                offset = readFrame(offset);
            }
        }
        return std::move(segment);
    }

  private:
    /** @return where to go on */
    std::size_t readFrame(std::size_t offset) {
        const std::optional<std::size_t> size = sizeOfSoundFront(offset);
        const std::size_t payload = offset + FRONT_BYTES;
        if (!size || *size > bytes.size() - payload ||
            !readPayload(offset, bytes.substr(payload, *size))) {
            ++segment.badBytes;
            return offset + 1;
        }
        return payload + *size;
    }

    std::optional<std::size_t> sizeOfSoundFront(std::size_t offset) const {
        if (bytes.size() - offset < FRONT_BYTES) {
            return std::nullopt;
        }
        const std::string_view front = bytes.substr(offset, FRONT_BYTES);
        const auto kind = get<uint32_t>(front, 8);
        const bool isKnown = kind == static_cast<uint32_t>(Kind::RECORD) ||
                             kind == static_cast<uint32_t>(Kind::NOTICE);
        if (!isKnown || get<uint32_t>(front, MARK_BYTES) !=
                            sumOfFront(front, number, static_cast<uint32_t>(offset))) {
            return std::nullopt;
        }
        return get<uint32_t>(front, 12);
    }

    bool readPayload(std::size_t offset, std::string_view payload) {
        const auto kind = static_cast<Kind>(get<uint32_t>(bytes, offset + 8));
        const std::size_t before = kind == Kind::NOTICE ? NOTICE_BYTES : 0;
        if (crc32({payload}) != get<uint32_t>(bytes, offset + 24) || payload.size() < before) {
            return false;
        }
        Frame frame;
        frame.offset = static_cast<uint32_t>(offset);
        frame.kind = kind;
        frame.time = get<int64_t>(bytes, offset + 16);
        frame.text = payload.substr(before);
        if (kind == Kind::NOTICE) {
            frame.notice.lost = get<uint64_t>(payload, 0);
            frame.notice.dropped = get<uint32_t>(payload, 8);
            frame.notice.replaces = get<uint64_t>(payload, 12);
        }
        const auto mark = get<uint32_t>(bytes, offset);
        frame.isDone = mark == DONE;
        segment.badMarks += mark != 0 && mark != DONE ? 1 : 0;
        segment.frames.push_back(frame);
        return true;
    }

    const std::string_view bytes;
    const uint32_t number;
    Segment segment;
};

}  // namespace

std::string makeHead(uint32_t segment) {
    std::string head(MAGIC);
    put(head, VERSION);
    put(head, sumOfHead(head, segment));
    return head;
}

std::string makeMark() {
    std::string mark;
    put(mark, DONE);
    return mark;
}

void makeFrame(std::string& frame, uint32_t segment, uint32_t offset, int64_t time,
               std::string_view text) {
    frame.assign(FRONT_BYTES, '\0');
    frame += text;
    fillFront(frame, Kind::RECORD, segment, offset, time);
}

void makeFrame(std::string& frame, uint32_t segment, uint32_t offset, int64_t time,
               std::string_view text, const Notice& notice) {
    frame.assign(FRONT_BYTES, '\0');
    put(frame, notice.lost);
    put(frame, notice.dropped);
    put(frame, notice.replaces);
    frame += text;
    fillFront(frame, Kind::NOTICE, segment, offset, time);
}

std::size_t frameBytes(std::size_t textBytes) {
    return FRONT_BYTES + NOTICE_BYTES + textBytes;
}

Segment read(std::string_view bytes, uint32_t segment) {
    return Reader(bytes, segment).read();
}

}  // namespace LogCollector::StoreFormat
