#include "talvox/impl/TestRecorder.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>
#include <vector>

#include "EngineTest.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using Talvox::TestRecorder;
using TestSupport::LogCapture;

using Bytes = std::vector<unsigned char>;

const std::size_t BUFFER_BYTES = 3200;

class Listener : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Sound::Recorder* /*recorder*/,
                                boost::shared_ptr<const Sound::SoundDataBuffer> buffer) override {
        buffers.push_back(buffer);
    }
    void onRecorderError(Sound::Recorder* recorder) override {
        ++errors;
        failed = recorder;
    }

    std::vector<boost::shared_ptr<const Sound::SoundDataBuffer>> buffers;
    int errors = 0;
    Sound::Recorder* failed = nullptr;
};

/** How many of the process's descriptors lead to a file. */
int countDescriptors(const std::string& path) {
    int count = 0;
    for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        std::error_code gone;
        count += std::filesystem::read_symlink(entry.path(), gone) == path ? 1 : 0;
    }
    return count;
}

class TestRecorderTest : public CloudTest::EngineTest {
  protected:
    /** @return the path of a file with these bytes */
    std::string makeFile(const Bytes& bytes) const {
        std::string path = directory.path("sound.pcm");
        std::ofstream file(path, std::ios::binary);
        file.write(reinterpret_cast<const char*>(bytes.data()),
                   static_cast<std::streamsize>(bytes.size()));
        EXPECT_TRUE(file.good());
        return path;
    }

    boost::shared_ptr<TestRecorder> makeRecorder(const std::string& path) {
        auto made = boost::make_shared<TestRecorder>(path);
        made->addListener(listener);
        made->setBufferLength(100);
        made->setSampleRate(16000);
        EXPECT_TRUE(made->init());
        return made;
    }

    TestSupport::ScratchDirectory directory;
    boost::shared_ptr<Listener> listener = boost::make_shared<Listener>();
};

TEST_F(TestRecorderTest, PlaysAFixedFile) {
    EXPECT_STREQ(TestRecorder::PATH, "/mnt/sdcard/test.pcm");
}

TEST_F(TestRecorderTest, PadsTheEndWithZerosAndGoesOnWithSilence) {
    const auto tested = makeRecorder(makeFile(Bytes(BUFFER_BYTES + 1, 0x5A)));
    tested->startRecording();
    advanceMs(300);
    ASSERT_EQ(listener->buffers.size(), 3U);
    EXPECT_EQ(listener->buffers[0]->getData(), Bytes(BUFFER_BYTES, 0x5A));
    Bytes second(BUFFER_BYTES, 0);
    second[0] = 0x5A;
    EXPECT_EQ(listener->buffers[1]->getData(), second);
    EXPECT_EQ(listener->buffers[2]->getData(), Bytes(BUFFER_BYTES, 0));
    EXPECT_EQ(listener->errors, 0);
    tested->stopRecording();
}

TEST_F(TestRecorderTest, DescribesItsBuffers) {
    const auto tested = makeRecorder(makeFile({}));
    tested->startRecording();
    advanceMs(100);
    ASSERT_EQ(listener->buffers.size(), 1U);
    const Sound::SoundDataInfo& info = listener->buffers[0]->getInfo();
    EXPECT_EQ(info.getCodec(), Sound::SoundDataInfo::NONE);
    EXPECT_EQ(info.getChannelCount(), 1);
    EXPECT_EQ(info.getSampleRate(), 16000);
    EXPECT_EQ(info.getSampleSize(), 2);
    EXPECT_EQ(info.getSampleCount(), 1600);
}

TEST_F(TestRecorderTest, KeepsTheSampleCountAtOtherRatesAndLengths) {
    const auto tested = makeRecorder(makeFile({}));
    tested->setSampleRate(8000);
    tested->setBufferLength(50);
    tested->startRecording();
    advanceMs(100);
    ASSERT_EQ(listener->buffers.size(), 2U);
    EXPECT_EQ(listener->buffers[0]->getInfo().getSampleRate(), 8000);
    EXPECT_EQ(listener->buffers[0]->getInfo().getSampleCount(), 1600);
    EXPECT_EQ(listener->buffers[0]->getData().size(), BUFFER_BYTES);
}

TEST_F(TestRecorderTest, ReportsAMissingFileAndPlaysSilence) {
    const LogCapture log;
    const auto tested = makeRecorder(directory.path("no-such-sound.pcm"));
    tested->startRecording();
    EXPECT_TRUE(log.contains("Error opening file"));
    EXPECT_EQ(listener->errors, 1);
    EXPECT_EQ(listener->failed, tested.get());
    advanceMs(100);
    ASSERT_EQ(listener->buffers.size(), 1U);
    EXPECT_EQ(listener->buffers[0]->getData(), Bytes(BUFFER_BYTES, 0));
}

TEST_F(TestRecorderTest, DeliversOnlyWhileRecording) {
    const auto tested = makeRecorder(makeFile(Bytes(10 * BUFFER_BYTES, 1)));
    advanceMs(500);
    EXPECT_TRUE(listener->buffers.empty());
    tested->startRecording();
    EXPECT_TRUE(tested->isRecording());
    advanceMs(200);
    EXPECT_EQ(listener->buffers.size(), 2U);
    tested->stopRecording();
    EXPECT_FALSE(tested->isRecording());
    advanceMs(500);
    EXPECT_EQ(listener->buffers.size(), 2U);
}

TEST_F(TestRecorderTest, BeginsAnewAtTheFilesBeginning) {
    Bytes sound(2 * BUFFER_BYTES, 1);
    sound[0] = 9;
    const auto tested = makeRecorder(makeFile(sound));
    tested->startRecording();
    advanceMs(200);
    tested->stopRecording();
    tested->startRecording();
    advanceMs(100);
    ASSERT_EQ(listener->buffers.size(), 3U);
    EXPECT_EQ(listener->buffers[2]->getData()[0], 9);
}

TEST_F(TestRecorderTest, ClosesItsFile) {
    const std::string path = makeFile({1, 2});
    auto tested = makeRecorder(path);
    EXPECT_EQ(countDescriptors(path), 0);
    tested->startRecording();
    EXPECT_EQ(countDescriptors(path), 1);
    tested->startRecording();
    EXPECT_EQ(countDescriptors(path), 1) << "left open by a second start";
    tested->stopRecording();
    EXPECT_EQ(countDescriptors(path), 0) << "left open by the stop";
    tested->startRecording();
    tested.reset();
    EXPECT_EQ(countDescriptors(path), 0) << "left open by the destructor";
}

TEST_F(TestRecorderTest, IsSilentOnceDestroyed) {
    auto tested = makeRecorder(makeFile({}));
    tested->startRecording();
    tested.reset();
    advanceMs(500);
    EXPECT_TRUE(listener->buffers.empty());
}

}  // namespace
