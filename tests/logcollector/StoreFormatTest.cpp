#include "logcollector/impl/StoreFormat.h"

#include <gmock/gmock.h>

#include <vector>

#include "logcollector/impl/Crc32.h"

using LogCollector::crc32;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
namespace StoreFormat = LogCollector::StoreFormat;
using StoreFormat::Kind;
using Head = StoreFormat::Segment::Head;

namespace {

constexpr uint32_t NUMBER = 7;

/** A segment with these records, all of them logged at second 5. */
std::string makeSegment(const std::vector<std::string>& texts) {
    std::string bytes = StoreFormat::makeHead(NUMBER);
    std::string frame;
    for (const std::string& text : texts) {
        StoreFormat::makeFrame(frame, NUMBER, static_cast<uint32_t>(bytes.size()), 5, text);
        bytes += frame;
    }
    return bytes;
}

std::vector<std::string> textsOf(const StoreFormat::Segment& segment) {
    std::vector<std::string> texts;
    for (const StoreFormat::Frame& frame : segment.frames) {
        texts.emplace_back(frame.text);
    }
    return texts;
}

TEST(StoreFormatTest, ChecksWithTheSumThatEverybodyUses) {
    EXPECT_EQ(0U, crc32({}));
    EXPECT_EQ(0xCBF43926U, crc32({"123456789"}));
    EXPECT_EQ(0xCBF43926U, crc32({"1234", "56789"}));
}

TEST(StoreFormatTest, HasTheBytesThatAreDocumented) {
    const std::string bytes = makeSegment({"ab"});
    ASSERT_EQ(16U + 28U + 2U, bytes.size());
    EXPECT_EQ(std::string("TvUsage\n\1\0\0\0", 12), bytes.substr(0, 12));
    const std::string front("\1\0\0\0\2\0\0\0\5\0\0\0\0\0\0\0", 16);
    EXPECT_EQ(std::string(4, '\0'), bytes.substr(16, 4));
    EXPECT_EQ(front, bytes.substr(24, 16));
    EXPECT_EQ("ab", bytes.substr(44));
    const std::string place("\7\0\0\0\20\0\0\0", 8);
    const uint32_t sum = crc32({std::string_view(bytes).substr(24, 20), place});
    EXPECT_EQ(static_cast<char>(sum), bytes[20]);
    EXPECT_EQ(static_cast<char>(sum >> 24U), bytes[23]);
    EXPECT_EQ("DONE", StoreFormat::makeMark());
}

TEST(StoreFormatTest, ReadsWhatItWrote) {
    std::string bytes = makeSegment({"one", "", std::string("\0;\xff=", 4)});
    bytes.replace(16, 4, StoreFormat::makeMark());
    std::string frame;
    const auto offset = static_cast<uint32_t>(bytes.size());
    StoreFormat::makeFrame(frame, NUMBER, offset, -3, "four", {1U << 30U, 6, 0x600000010});
    const StoreFormat::Segment segment = StoreFormat::read(bytes += frame, NUMBER);
    EXPECT_TRUE(segment.isSound());
    ASSERT_THAT(textsOf(segment), ElementsAre("one", "", std::string("\0;\xff=", 4), "four"));
    EXPECT_TRUE(segment.frames[0].isDone);
    EXPECT_FALSE(segment.frames[1].isDone);
    EXPECT_EQ(16U, segment.frames[0].offset);
    EXPECT_EQ(5, segment.frames[2].time);
    EXPECT_EQ(Kind::RECORD, segment.frames[2].kind);
    EXPECT_EQ(Kind::NOTICE, segment.frames[3].kind);
    EXPECT_EQ(offset, segment.frames[3].offset);
    EXPECT_EQ(-3, segment.frames[3].time);
    EXPECT_EQ(1U << 30U, segment.frames[3].notice.lost);
    EXPECT_EQ(6U, segment.frames[3].notice.dropped);
    EXPECT_EQ(0x600000010U, segment.frames[3].notice.replaces);
}

TEST(StoreFormatTest, FindsNoRecordWhereItWasNotWritten) {
    const std::string bytes = makeSegment({"one"});
    EXPECT_THAT(StoreFormat::read(bytes, NUMBER + 1).frames, IsEmpty());
    const std::string moved = bytes + bytes.substr(StoreFormat::HEAD_BYTES);
    const StoreFormat::Segment segment = StoreFormat::read(moved, NUMBER);
    EXPECT_THAT(textsOf(segment), ElementsAre("one"));
    EXPECT_EQ(bytes.size() - StoreFormat::HEAD_BYTES, segment.badBytes);
}

TEST(StoreFormatTest, LeavesALaterVersionAlone) {
    std::string bytes = makeSegment({"one"});
    bytes[8] = 2;
    EXPECT_EQ(Head::DAMAGED, StoreFormat::read(bytes, NUMBER).head);
    const std::string place("\7\0\0\0", 4);
    const uint32_t sum = crc32({std::string_view(bytes).substr(0, 12), place});
    for (std::size_t i = 0; i < 4; ++i) {
        bytes[12 + i] = static_cast<char>(sum >> 8 * i);
    }
    const StoreFormat::Segment segment = StoreFormat::read(bytes, NUMBER);
    EXPECT_EQ(Head::NEWER, segment.head);
    EXPECT_FALSE(segment.isSound());
    EXPECT_THAT(segment.frames, IsEmpty());
}

TEST(StoreFormatTest, LosesNoOtherRecordToAChangedByte) {
    const std::vector<std::string> texts = {"first", "second", "third"};
    const std::string sound = makeSegment(texts);
    for (std::size_t at = 0; at < sound.size(); ++at) {
        for (const unsigned change : {0x01U, 0x80U, 0xFFU}) {
            std::string bytes = sound;
            bytes[at] = static_cast<char>(static_cast<unsigned char>(bytes[at]) ^ change);
            const StoreFormat::Segment segment = StoreFormat::read(bytes, NUMBER);
            EXPECT_FALSE(segment.isSound()) << at;
            std::vector<std::string> expected = texts;
            std::size_t start = StoreFormat::HEAD_BYTES;
            for (std::size_t i = 0; i < texts.size(); ++i) {
                const std::size_t end = start + StoreFormat::FRONT_BYTES + texts[i].size();
                if (at >= start + 4 && at < end) {
                    expected.erase(expected.begin() + static_cast<std::ptrdiff_t>(i));
                    EXPECT_EQ(end - start, segment.badBytes) << at;
                }
                start = end;
            }
            EXPECT_EQ(expected, textsOf(segment)) << at;
        }
    }
}

TEST(StoreFormatTest, ReadsWhatIsWholeOfAFileOfAnyLength) {
    const std::vector<std::string> texts = {"first", "second", "third"};
    const std::string whole = makeSegment(texts);
    for (std::size_t size = 0; size < whole.size(); ++size) {
        const StoreFormat::Segment segment =
            StoreFormat::read(std::string_view(whole).substr(0, size), NUMBER);
        std::vector<std::string> expected;
        std::size_t end = StoreFormat::HEAD_BYTES;
        bool isCutBetween = size == end;
        for (const std::string& text : texts) {
            end += StoreFormat::FRONT_BYTES + text.size();
            if (end <= size) {
                expected.push_back(text);
            }
            isCutBetween = isCutBetween || size == end;
        }
        EXPECT_EQ(expected, textsOf(segment)) << size;
        EXPECT_EQ(isCutBetween, segment.isSound()) << size;
    }
}

}  // namespace
