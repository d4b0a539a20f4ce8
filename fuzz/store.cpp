/* Records, then changes to their file: the reader must find each record that no change touches, and
 * nothing else; a store must open on the file, whatever is in it, and take a record. */
#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

#include "Fuzz.h"
#include "logcollector/impl/LogStore.h"
#include "logcollector/impl/StoreFormat.h"
#include "support/ScratchDirectory.h"

namespace {

using Fuzz::require;
using LogCollector::LogRecord;
using LogCollector::LogStore;
using LogCollector::StoreFormat::Frame;
using LogCollector::StoreFormat::Segment;
namespace StoreFormat = LogCollector::StoreFormat;

constexpr uint32_t NUMBER = 1;
constexpr std::size_t RECORDS_MAX = 20;
constexpr std::size_t MARK_BYTES = 4;

/** A record as it was written. */
struct Written {
    std::size_t offset = 0;
    std::size_t end = 0;
    std::string text;
    bool isDone = false;
};

/** A segment of the records that the input describes, then changed as it says. */
class File {
  public:
    explicit File(Fuzz::Input& input) : bytes(StoreFormat::makeHead(NUMBER)) {
        const std::size_t count = input.takeBelow(RECORDS_MAX + 1);
        for (std::size_t i = 0; i < count; ++i) {
            write(input);
        }
        sound = bytes;
        while (!input.isEmpty()) {
            change(input);
        }
    }

    /** Whether the record is as it was, but for its mark. */
    bool isUntouched(const Written& record) const {
        const std::size_t from = record.offset + MARK_BYTES;
        return bytes.size() >= record.end &&
               bytes.compare(from, record.end - from, sound, from, record.end - from) == 0;
    }

    /** Whether a change makes a frame of its own: the fuzzer sees the check sums. */
    bool isForged(const Segment& segment) const {
        return std::any_of(
            segment.frames.begin(), segment.frames.end(), [this](const Frame& frame) {
                return std::none_of(
                    records.begin(), records.end(),
                    [&frame](const Written& record) { return record.offset == frame.offset; });
            });
    }

    std::string bytes;
    std::vector<Written> records;

  private:
    void write(Fuzz::Input& input) {
        const uint8_t form = input.takeByte();
        Written record;
        record.offset = bytes.size();
        record.text = input.takeText();
        record.isDone = (form & 1U) != 0;
        std::string frame;
        const auto offset = static_cast<uint32_t>(record.offset);
        const auto time = static_cast<int64_t>(form) * 1000;
        if ((form & 2U) != 0) {
            // Drops no segment and replaces nothing: so no other record depends on it.
            StoreFormat::makeFrame(frame, NUMBER, offset, time, record.text, {form, 0, 0});
        } else {
            StoreFormat::makeFrame(frame, NUMBER, offset, time, record.text);
        }
        if (record.isDone) {
            frame.replace(0, MARK_BYTES, StoreFormat::makeMark());
        }
        bytes += frame;
        record.end = bytes.size();
        records.push_back(record);
    }

    void change(Fuzz::Input& input) {
        const uint8_t kind = input.takeByte();
        const std::size_t at = bytes.empty() ? 0 : input.takeWord() % bytes.size();
        const std::string piece = input.takeText();
        if (kind % 8 == 7) {
            bytes.resize(at);
        } else if (kind % 8 == 6) {
            bytes += piece;
        } else {
            bytes.replace(at, std::min(piece.size(), bytes.size() - at), piece);
        }
    }

    std::string sound;
};

void checkReader(const File& file) {
    const Segment segment = StoreFormat::read(file.bytes, NUMBER);
    std::size_t sum = 0;
    std::size_t last = StoreFormat::HEAD_BYTES;
    for (const Frame& frame : segment.frames) {
        const char* const text = frame.text.data();
        require(frame.offset >= last, "frames come in their order and do not overlap");
        require(text >= file.bytes.data() + frame.offset + StoreFormat::FRONT_BYTES &&
                    text + frame.text.size() <= file.bytes.data() + file.bytes.size(),
                "a frame's text is within the file");
        last = static_cast<std::size_t>(text - file.bytes.data()) + frame.text.size();
        sum += last - frame.offset;
    }
    if (file.bytes.size() > StoreFormat::HEAD_BYTES && segment.head != Segment::Head::NEWER) {
        require(sum + segment.badBytes == file.bytes.size() - StoreFormat::HEAD_BYTES,
                "each byte belongs to a record or is bad");
    }
    for (const Written& record : file.records) {
        const auto found =
            std::find_if(segment.frames.begin(), segment.frames.end(),
                         [&record](const Frame& frame) { return frame.offset == record.offset; });
        const bool isFound = found != segment.frames.end() && found->text == record.text;
        require(isFound || !file.isUntouched(record) || segment.head == Segment::Head::NEWER ||
                    file.isForged(segment),
                "a record that no change touches is found");
    }
}

void checkStore(const File& file) {
    static const TestSupport::ScratchDirectory scratch;
    LogCollector::LogStoreOptions options;
    options.folder = scratch.path("store");
    std::filesystem::remove_all(options.folder);
    std::filesystem::create_directory(options.folder);
    std::ofstream(options.folder + "/records-0000000001", std::ios::binary) << file.bytes;
    LogStore::Rest rest;
    auto store = LogStore::open(options, rest);
    if (store == nullptr) {
        return;  // of a later version
    }
    const std::size_t left = rest.records.size();
    require(store->add("new") != 0, "a store takes a record");
    store.reset();
    rest = LogStore::Rest();
    store = LogStore::open(options, rest);
    require(
        store != nullptr && rest.records.size() == left + 1 && rest.records.back().text == "new",
        "a store has what it had and what it took");
    for (const LogRecord& record : rest.records) {
        store->remove(record.ticket);
    }
    store.reset();
    rest = LogStore::Rest();
    store = LogStore::open(options, rest);
    require(store != nullptr && rest.records.empty(), "what is delivered is gone");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Fuzz::Input input(data, size);
    const File file(input);
    checkReader(file);
    checkStore(file);
    return 0;
}
