#include "talvox/impl/ParallelEncoder.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <condition_variable>
#include <mutex>
#include <thread>

#include "EngineTest.h"
#include "Sounds.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"

namespace {

using CloudTest::BufferPtr;
using CloudTest::makeBuffer;
using Talvox::ParallelEncoder;
using Talvox::RecognizeRequest;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;

/** Puts "<...>" around each buffer, "[" before the first and "]" after the last. */
class BracketEncoder : public Sound::Encoder {
  public:
    void encode(const Sound::SoundDataBuffer& buffer) override {
        waitWhileHeld();
        const std::lock_guard<std::mutex> lock(mutex);
        overlapped = overlapped || encoding;
        encoding = true;
        thread = std::this_thread::get_id();
        if (!isMute) {
            output += '<' + std::string(buffer.getData().begin(), buffer.getData().end()) + '>';
        }
        encoding = false;
    }

    boost::shared_ptr<Sound::SoundDataBuffer> takeOutput(int maxBytes) override {
        const std::lock_guard<std::mutex> lock(mutex);
        EXPECT_EQ(maxBytes, -1);
        if (givesNull) {
            return nullptr;
        }
        auto taken = boost::make_shared<Sound::SoundDataBuffer>(Sound::SoundDataInfo());
        taken->getData().assign(output.begin(), output.end());
        output.clear();
        return taken;
    }

    void finish() override {
        const std::lock_guard<std::mutex> lock(mutex);
        ++finishes;
        output += ']';
    }

    void hold() {
        const std::lock_guard<std::mutex> lock(mutex);
        isHeld = true;
    }

    void release() {
        const std::lock_guard<std::mutex> lock(mutex);
        isHeld = false;
        changed.notify_all();
    }

    void waitUntilWaiting() {
        std::unique_lock<std::mutex> lock(mutex);
        ASSERT_TRUE(changed.wait_for(lock, std::chrono::seconds(10), [this] { return isWaiting; }));
    }

    int finishes = 0;
    bool isMute = false;
    bool givesNull = false;
    bool overlapped = false;
    std::thread::id thread;

  private:
    void waitWhileHeld() {
        std::unique_lock<std::mutex> lock(mutex);
        isWaiting = true;
        changed.notify_all();
        changed.wait(lock, [this] { return !isHeld; });
        isWaiting = false;
    }

    std::mutex mutex;
    std::condition_variable changed;
    std::string output = "[";
    bool encoding = false;
    bool isHeld = false;
    bool isWaiting = false;
};

BufferPtr makeText(const std::string& text) {
    return makeBuffer({text.begin(), text.end()});
}

class ParallelEncoderTest : public CloudTest::EngineTest {
  protected:
    ParallelEncoderTest() {
        request->writer = boost::make_shared<Network::NetworkTaskWriter>();
        configure([](Talvox::Settings& settings) {
            settings.putInt(Talvox::Settings::SKS_VERBOSE_LEVEL, 2);
        });
    }

    ~ParallelEncoderTest() override {
        encoder->release();
        const Util::EventLock lock;
        parallel.reset();
    }

    void makeWriting() { parallel = boost::make_shared<ParallelEncoder>(encoder, request); }

    void makeCalling() {
        parallel = boost::make_shared<ParallelEncoder>(
            encoder, [this](const boost::shared_ptr<const Sound::SoundDataBuffer>& output) {
                const std::lock_guard<std::mutex> lock(mutex);
                outputs.push_back(
                    output ? std::string(output->getData().begin(), output->getData().end())
                           : "null");
                changed.notify_all();
            });
    }

    void write(const std::string& text) {
        const Util::EventLock lock;
        parallel->write(makeText(text));
    }

    void closeWrite() {
        const Util::EventLock lock;
        parallel->closeWrite();
    }

    std::vector<std::string> waitForOutput() {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait_for(lock, std::chrono::seconds(10), [this] { return !outputs.empty(); });
        return outputs;
    }

    /** Waits until the request is closed and gives what was written to it. */
    std::string waitForClose() {
        request->writer->setWakeUp([this] {
            const std::lock_guard<std::mutex> lock(mutex);
            changed.notify_all();
        });
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait_for(lock, std::chrono::seconds(10),
                         [this] { return request->writer->isClosed(); });
        lock.unlock();
        // The closing itself runs to its end under the event lock.
        const Util::EventLock eventLock;
        return getWritten();
    }

    std::string getWritten() const {
        std::string body(request->writer->getSize(), '\0');
        request->writer->read(0, &body[0], body.size());
        return body;
    }

    /** What closing a request adds. */
    const std::string bodyEnd = "\r\n--1BEF0A57BE110FD467A--\r\n";

    boost::shared_ptr<BracketEncoder> encoder = boost::make_shared<BracketEncoder>();
    boost::shared_ptr<RecognizeRequest> request =
        boost::make_shared<RecognizeRequest>(Talvox::Settings(), Talvox::Settings());
    boost::shared_ptr<ParallelEncoder> parallel;

  private:
    std::mutex mutex;
    std::condition_variable changed;
    std::vector<std::string> outputs;
};

TEST_F(ParallelEncoderTest, WritesEncodedBuffersInOrderAndCloses) {
    makeWriting();
    std::string expected = "[";
    for (int i = 0; i < 50; ++i) {
        write(std::to_string(i));
        expected += '<' + std::to_string(i) + '>';
    }
    closeWrite();
    EXPECT_EQ(waitForClose(), expected + "]" + bodyEnd);
    EXPECT_FALSE(encoder->overlapped);
    EXPECT_NE(encoder->thread, std::this_thread::get_id());
}

TEST_F(ParallelEncoderTest, CallsBackOnceWithTheWholeStream) {
    makeCalling();
    write("a");
    write("b");
    closeWrite();
    EXPECT_EQ(waitForOutput(), std::vector<std::string>{"[<a><b>]"});
}

TEST_F(ParallelEncoderTest, SaysWhatItWritesAndWhen) {
    const LogCapture log;
    makeWriting();
    write("a");
    closeWrite();
    waitForClose();
    const KDtime now = kdTime(nullptr);
    KDTm local = {};
    kdLocaltime_r(&now, &local);
    char time[10];
    kdSprintf_s(time, sizeof time, "%02d:%02d:%02d", local.tm_hour, local.tm_min, local.tm_sec);
    EXPECT_EQ(log.messages(), (std::vector<std::string>{
                                  std::string("ParallelEncoder writes 4 bytes at ") + time,
                                  std::string("ParallelEncoder writes the last 1 bytes at ") + time,
                                  "ParallelEncoder closes"}));
}

TEST_F(ParallelEncoderTest, ClosedWithoutSoundWritesWhatTheEncoderEmits) {
    makeWriting();
    closeWrite();
    EXPECT_EQ(getWritten(), "[]" + bodyEnd);
    EXPECT_TRUE(request->writer->isClosed());
}

TEST_F(ParallelEncoderTest, ClosedWithoutSoundCallsBackWithNothing) {
    const LogCapture log;
    makeCalling();
    closeWrite();
    EXPECT_EQ(waitForOutput(), std::vector<std::string>{""});
    EXPECT_TRUE(log.contains("ParallelEncoder calls back with 0 bytes"));
    EXPECT_EQ(encoder->finishes, 1);
}

TEST_F(ParallelEncoderTest, CloseWaitsForQueuedBuffers) {
    makeWriting();
    encoder->hold();
    write("a");
    write("b");
    closeWrite();
    encoder->waitUntilWaiting();
    EXPECT_EQ(getWritten(), "");
    EXPECT_FALSE(request->writer->isClosed());
    encoder->release();
    EXPECT_EQ(waitForClose(), "[<a><b>]" + bodyEnd);
}

TEST_F(ParallelEncoderTest, WritesNothingWhereThereIsNoOutput) {
    const LogCapture log;
    makeWriting();
    encoder->isMute = true;
    encoder->takeOutput(-1);
    write("a");
    closeWrite();
    EXPECT_EQ(waitForClose(), "]" + bodyEnd);
    EXPECT_FALSE(log.containsPart("ParallelEncoder writes 0 bytes"));
}

TEST_F(ParallelEncoderTest, ReportsAMissingCallback) {
    const AssertCapture asserts;
    parallel = boost::make_shared<ParallelEncoder>(encoder, ParallelEncoder::Callback());
    closeWrite();
    EXPECT_EQ(asserts.reports(), (std::vector<TestSupport::AssertReport>{
                                     {"writer || callback", "talvox/impl/ParallelEncoder", 120}}));
}

TEST_F(ParallelEncoderTest, ReportsAMissingEncoderAndStillCloses) {
    const AssertCapture asserts;
    parallel = boost::make_shared<ParallelEncoder>(boost::shared_ptr<Sound::Encoder>(), request);
    closeWrite();
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "px != 0");
    EXPECT_TRUE(request->writer->isClosed());
}

TEST_F(ParallelEncoderTest, ReportsAMissingOutputAndStillCallsBack) {
    const AssertCapture asserts;
    encoder->givesNull = true;
    makeCalling();
    closeWrite();
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "px != 0");
    EXPECT_EQ(waitForOutput(), std::vector<std::string>{"null"});
}

TEST_F(ParallelEncoderTest, CancelWithoutTaskDoesNothing) {
    makeWriting();
    {
        const Util::EventLock lock;
        parallel->cancel();
    }
    write("a");
    closeWrite();
    EXPECT_EQ(waitForClose(), "[<a>]" + bodyEnd);
}

TEST_F(ParallelEncoderTest, CancelledTaskIsNeverHeardOfAgain) {
    makeWriting();
    encoder->hold();
    write("a");
    write("b");
    encoder->waitUntilWaiting();
    {
        const Util::EventLock lock;
        parallel->cancel();
    }
    encoder->release();
    closeWrite();
    kdDrainEventsKOR();
    EXPECT_EQ(getWritten(), "");
    EXPECT_FALSE(request->writer->isClosed());
}

TEST_F(ParallelEncoderTest, MayBeDestroyedWhileATaskRuns) {
    makeWriting();
    encoder->hold();
    write("a");
    encoder->waitUntilWaiting();
    {
        const Util::EventLock lock;
        parallel.reset();
    }
    encoder->release();
    kdDrainEventsKOR();
    EXPECT_EQ(getWritten(), "");
}

TEST_F(ParallelEncoderTest, CallbackMayDestroyIt) {
    int calls = 0;
    parallel = boost::make_shared<ParallelEncoder>(
        encoder, [this, &calls](const boost::shared_ptr<const Sound::SoundDataBuffer>&) {
            parallel.reset();
            ++calls;
        });
    ParallelEncoder* const raw = parallel.get();
    {
        const Util::EventLock lock;
        raw->closeWrite();
    }
    EXPECT_EQ(calls, 1);
    EXPECT_FALSE(parallel);
}

}  // namespace
