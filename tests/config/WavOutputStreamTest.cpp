#include "util/WavOutputStream.h"

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <signal.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "pal/kd_file.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "util/impl/WavHeader.h"

using ::testing::ElementsAre;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using Util::WavHeader;
using Util::WavOutputStream;

namespace {

/** Size of the items whose writing fails; 0 for none. */
KDsize failingSize = 0;

}  // namespace

/** Stands in front of the platform layer's own. */
KDsize kdFwrite(const void* buffer, KDsize size, KDsize count, KDFile* file) {
    static const auto real = reinterpret_cast<decltype(&kdFwrite)>(dlsym(RTLD_NEXT, "kdFwrite"));
    return size == failingSize ? 0 : real(buffer, size, count, file);
}

namespace {

const Sound::SoundDataInfo WIDE(Sound::SoundDataInfo::NONE, 1, 16000, 2);

/** Files of this process have room for so many bytes while it lives. */
class FileSizeLimit {
  public:
    explicit FileSizeLimit(rlim_t bytes) : handler(signal(SIGXFSZ, SIG_IGN)) {
        getrlimit(RLIMIT_FSIZE, &before);
        const rlimit limit{bytes, before.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &before);
        signal(SIGXFSZ, handler);
    }
    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

  private:
    rlimit before{};
    void (*const handler)(int);
};

class WavOutputStreamTest : public ::testing::Test {
  protected:
    WavOutputStreamTest()
        : path(::testing::TempDir() + "wav_output_stream_" + std::to_string(getpid()) + ".wav") {}
    ~WavOutputStreamTest() override {
        failingSize = 0;
        std::remove(path.c_str());
    }

    std::vector<std::uint8_t> bytes() const {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
    }

    const std::string path;
};

std::uint32_t number(const std::vector<std::uint8_t>& bytes, std::size_t offset, int size) {
    std::uint32_t value = 0;
    for (int i = size - 1; i >= 0; --i) {
        value = value << 8U | bytes.at(offset + static_cast<std::size_t>(i));
    }
    return value;
}

std::string text(const std::vector<std::uint8_t>& bytes, std::size_t offset) {
    return {bytes.begin() + static_cast<std::ptrdiff_t>(offset),
            bytes.begin() + static_cast<std::ptrdiff_t>(offset) + 4};
}

}  // namespace

TEST_F(WavOutputStreamTest, WritesTheWholeHeaderOfWideMonoSound) {
    {
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
    }
    const std::vector<std::uint8_t> expected{
        'R',  'I',  'F', 'F', 36,   0,    0,   0,  // 36: the rest of the header
        'W',  'A',  'V', 'E', 'f',  'm',  't', ' ', 16, 0, 0, 0,
        1,    0,    1,   0,   0x80, 0x3E, 0,   0,  // 16000 Hz
        0x00, 0x7D, 0,   0,                        // 32000 bytes a second
        2,    0,    16,  0,   'd',  'a',  't', 'a', 0,  0, 0, 0};
    EXPECT_EQ(expected, bytes());
}

TEST_F(WavOutputStreamTest, DerivesTheFieldsFromTheFormatAndIgnoresTheCodec) {
    {
        WavOutputStream stream;
        ASSERT_TRUE(
            stream.init(path, Sound::SoundDataInfo(Sound::SoundDataInfo::SPEEX, 2, 44100, 3, 7)));
    }
    const std::vector<std::uint8_t> written = bytes();
    ASSERT_EQ(44U, written.size());
    EXPECT_EQ(1U, number(written, 20, 2));
    EXPECT_EQ(2U, number(written, 22, 2));
    EXPECT_EQ(44100U, number(written, 24, 4));
    EXPECT_EQ(264600U, number(written, 28, 4));
    EXPECT_EQ(6U, number(written, 32, 2));
    EXPECT_EQ(24U, number(written, 34, 2));
}

TEST_F(WavOutputStreamTest, ClosingWritesTheLengths) {
    std::vector<std::uint8_t> samples(1600);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] = static_cast<std::uint8_t>(i * 7);
    }
    WavOutputStream stream;
    ASSERT_TRUE(stream.init(path, WIDE));
    EXPECT_EQ(1600, stream.write(samples.data(), 1600));
    EXPECT_EQ(1600, stream.write(samples.data(), 1600));
    const LogCapture log;
    stream.close();
    EXPECT_THAT(log.messages(), ElementsAre("close: after kdFclose"));
    const std::vector<std::uint8_t> written = bytes();
    ASSERT_EQ(3244U, written.size());
    EXPECT_EQ("RIFF", text(written, 0));
    EXPECT_EQ(3236U, number(written, 4, 4));
    EXPECT_EQ("data", text(written, 36));
    EXPECT_EQ(3200U, number(written, 40, 4));
    EXPECT_TRUE(std::equal(samples.begin(), samples.end(), written.begin() + 44));
    EXPECT_TRUE(std::equal(samples.begin(), samples.end(), written.begin() + 1644));
}

TEST_F(WavOutputStreamTest, DestroyingAStreamClosesIt) {
    {
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
        stream.write("abcd", 4);
    }
    EXPECT_EQ(4U, number(bytes(), 40, 4));
}

TEST_F(WavOutputStreamTest, CountsSingleBytes) {
    {
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
        EXPECT_EQ(1, stream.write("a", 1));
        EXPECT_EQ(1, stream.write("b", 1));
    }
    EXPECT_EQ(46U, bytes().size());
    EXPECT_EQ(38U, number(bytes(), 4, 4));
    EXPECT_EQ(2U, number(bytes(), 40, 4));
}

TEST_F(WavOutputStreamTest, WritingNothingChangesNothing) {
    {
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
        EXPECT_EQ(0, stream.write("", 0));
    }
    EXPECT_EQ(44U, bytes().size());
    EXPECT_EQ(0U, number(bytes(), 40, 4));
}

TEST_F(WavOutputStreamTest, ClosingTwiceIsHarmless) {
    WavOutputStream stream;
    ASSERT_TRUE(stream.init(path, WIDE));
    stream.write("abcd", 4);
    stream.close();
    const std::vector<std::uint8_t> closed = bytes();
    const LogCapture log;
    stream.close();
    EXPECT_THAT(log.messages(),
                ElementsAre("patchHeader: error in fseek", "close: after kdFclose"));
    EXPECT_EQ(closed, bytes());
    EXPECT_EQ(0, stream.write("efgh", 4));
    EXPECT_EQ(closed, bytes());
}

TEST_F(WavOutputStreamTest, WithoutAFileEveryOperationSaysSo) {
    const LogCapture log;
    {
        WavOutputStream stream;
        EXPECT_EQ(-1, stream.write("abcd", 4));
        stream.close();
    }
    EXPECT_THAT(log.messages(), ElementsAre("write: file not opened", "close: file not opened",
                                            "close: file not opened"));
}

TEST_F(WavOutputStreamTest, AMissingDirectoryIsReported) {
    const std::string missing = path + ".missing/in.wav";
    WavOutputStream stream;
    const LogCapture log;
    EXPECT_FALSE(stream.init(missing, WIDE));
    EXPECT_EQ(-1, stream.write("abcd", 4));
    EXPECT_THAT(log.messages(),
                ElementsAre("init: could not open file " + missing, "write: file not opened"));
}

TEST_F(WavOutputStreamTest, AFileWithoutPositionsIsRefused) {
    int ends[2];
    ASSERT_EQ(0, pipe(ends));
    const std::string writeEnd = "/proc/self/fd/" + std::to_string(ends[1]);
    if (access(writeEnd.c_str(), W_OK) != 0) {
        close(ends[0]);
        close(ends[1]);
        GTEST_SKIP() << "no /proc file system";
    }
    WavOutputStream stream;
    const LogCapture log;
    EXPECT_FALSE(stream.init(writeEnd, WIDE));
    EXPECT_EQ(-1, stream.write("abcd", 4));
    EXPECT_THAT(log.messages(),
                ElementsAre("writeHeader: error in fseek", "write: file not opened"));
    close(ends[0]);
    close(ends[1]);
}

TEST_F(WavOutputStreamTest, AFullDeviceIsReported) {
    if (access("/dev/full", W_OK) != 0) {
        GTEST_SKIP() << "no /dev/full";
    }
    const LogCapture log;
    WavOutputStream stream;
    EXPECT_FALSE(stream.init("/dev/full", WIDE));
    EXPECT_THAT(log.messages(), ElementsAre("writeHeader: error in write"));
}

TEST_F(WavOutputStreamTest, TheHeaderCountsWhatAFullFileHolds) {
    const int size = 3200;
    const std::vector<char> buffer(size, 7);
    const LogCapture log;
    {
        const FileSizeLimit limit(4096);
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
        EXPECT_EQ(size, stream.write(buffer.data(), size));
        EXPECT_EQ(4096 - 44 - size, stream.write(buffer.data(), size));
        EXPECT_EQ(0, stream.write(buffer.data(), size));
    }
    EXPECT_EQ(4096U, bytes().size());
    EXPECT_EQ(4096U - 8, number(bytes(), 4, 4));
    EXPECT_EQ(4096U - 44, number(bytes(), 40, 4));
    EXPECT_THAT(log.messages(), ElementsAre("write: error in write", "close: after kdFclose"));
}

TEST_F(WavOutputStreamTest, AHeaderThatCannotBeWrittenIsReported) {
    failingSize = 44;
    WavOutputStream stream;
    const LogCapture log;
    EXPECT_FALSE(stream.init(path, WIDE));
    EXPECT_EQ(-1, stream.write("abcd", 4));
    EXPECT_THAT(log.messages(),
                ElementsAre("writeHeader: error in write", "write: file not opened"));
}

TEST_F(WavOutputStreamTest, SizesThatCannotBeWrittenAreReportedOnce) {
    WavOutputStream stream;
    ASSERT_TRUE(stream.init(path, WIDE));
    stream.write("abcdef", 6);
    failingSize = 4;
    const LogCapture log;
    stream.close();
    EXPECT_THAT(log.messages(),
                ElementsAre("patchHeader: error in write", "close: after kdFclose"));
    EXPECT_EQ(0U, number(bytes(), 4, 4));
    EXPECT_EQ(0U, number(bytes(), 40, 4));
    EXPECT_EQ(50U, bytes().size());
}

TEST_F(WavOutputStreamTest, ASecondInitFinishesTheFirstFile) {
    const std::string second = path + ".second";
    {
        WavOutputStream stream;
        ASSERT_TRUE(stream.init(path, WIDE));
        stream.write("abcd", 4);
        ASSERT_TRUE(stream.init(second, WIDE));
        EXPECT_EQ(4U, number(bytes(), 40, 4));
    }
    std::ifstream file(second, std::ios::binary);
    const std::vector<std::uint8_t> written{std::istreambuf_iterator<char>(file),
                                            std::istreambuf_iterator<char>()};
    EXPECT_EQ(44U, written.size());
    EXPECT_EQ(36U, number(written, 4, 4));
    EXPECT_EQ(0U, number(written, 40, 4));
    std::remove(second.c_str());
}

TEST_F(WavOutputStreamTest, ANegativeSizeIsABrokenInvariant) {
    WavOutputStream stream;
    ASSERT_TRUE(stream.init(path, WIDE));
    const AssertCapture asserts;
    EXPECT_EQ(-1, stream.write("abcd", -4));
    EXPECT_EQ(1U, asserts.count());
}

TEST(WavHeader, NumbersAreLittleEndian) {
    EXPECT_THAT(WavHeader::littleEndian(0x04030201U), ElementsAre(1, 2, 3, 4));
    EXPECT_THAT(WavHeader::littleEndian(0xFFFFFFFEU), ElementsAre(0xFE, 0xFF, 0xFF, 0xFF));
}

TEST(WavHeader, LengthsBeyondFourGigabytesAreCut) {
    EXPECT_EQ(36U, WavHeader::chunkSize(0));
    EXPECT_EQ(0xFFFFFFFFU, WavHeader::chunkSize(0xFFFFFFFFU - 36));
    EXPECT_EQ(0xFFFFFFFFU, WavHeader::chunkSize(0xFFFFFFFFU - 35));
    EXPECT_EQ(0xFFFFFFFFU, WavHeader::chunkSize(0xFFFFFFFFU));
    EXPECT_EQ(3200U, WavHeader::grow(1600, 1600));
    EXPECT_EQ(0xFFFFFFFFU, WavHeader::grow(0xFFFFFFF0U, 15));
    EXPECT_EQ(0xFFFFFFFFU, WavHeader::grow(0xFFFFFFF0U, 16));
}
