#include "core/sound/QueuedRecorder.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <vector>

#include "core/util/EventLock.h"
#include "pal/kd_event.h"

namespace {

using Sound::CaptureQueue;
using Sound::QueuedRecorder;
using Sound::Recorder;
using Sound::RecorderFormat;
using Sound::SoundDataBuffer;

constexpr int BUFFER_MS = 10;
constexpr std::size_t BUFFER_BYTES = 320;

/** Its device is the test. */
class HandDevice : public QueuedRecorder {
  public:
    HandDevice() : QueuedRecorder("HandDevice") { setBufferLength(BUFFER_MS); }
    ~HandDevice() override { stopRecording(); }

    /** One buffer whose bytes are all `value`. */
    void push(unsigned char value) {
        const std::vector<unsigned char> bytes(BUFFER_BYTES, value);
        output->push(bytes.data(), bytes.size());
    }

    boost::shared_ptr<CaptureQueue> output;

  protected:
    bool openDevice(const RecorderFormat& /*format*/,
                    const boost::shared_ptr<CaptureQueue>& target) override {
        output = target;
        return true;
    }
    void beginDevice() override {}
    void endDevice() override {}
};

class Values : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Recorder* /*recorder*/,
                                boost::shared_ptr<const SoundDataBuffer> buffer) override {
        values.push_back(buffer->getData().at(0));
        if (reaction) {
            reaction(values.back());
        }
    }
    void onRecorderError(Recorder* /*recorder*/) override { values.push_back(-1); }

    std::vector<int> values;
    std::function<void(int value)> reaction;
};

class QueuedRecorderTest : public ::testing::Test {
  protected:
    QueuedRecorderTest() { recorder->addListener(listener); }

    std::vector<int> drain() {
        kdDrainEventsKOR();
        kdDrainEventsKOR();  // for what the first deliveries have posted
        const Util::EventLock lock;
        return listener->values;
    }

    boost::shared_ptr<HandDevice> recorder = boost::make_shared<HandDevice>();
    boost::shared_ptr<Values> listener = boost::make_shared<Values>();
};

TEST_F(QueuedRecorderTest, DeliversWhatComesWhileADeliveryIsOnItsWay) {
    {
        const Util::EventLock lock;
        recorder->init();
        recorder->startRecording();
        recorder->push(1);
        // The start's own delivery takes the first buffer; that of the queue is still on its way.
        listener->reaction = [this](int value) {
            if (value < 4) {
                recorder->push(static_cast<unsigned char>(value + 1));
            }
        };
    }
    kdDrainEventsKOR();
    EXPECT_EQ(drain(), (std::vector<int>{1, 2, 3, 4}));
}

TEST_F(QueuedRecorderTest, MayGoWhileADeliveryIsOnItsWay) {
    {
        const Util::EventLock lock;
        recorder->init();
        recorder->startRecording();
        recorder->push(1);
        recorder.reset();
    }
    EXPECT_EQ(drain(), std::vector<int>());
}

TEST_F(QueuedRecorderTest, DeliversOnlyWhatComesAfterItsLastStart) {
    {
        const Util::EventLock lock;
        recorder->init();
        recorder->startRecording();
        recorder->push(1);
        recorder->stopRecording();
        recorder->startRecording();
        recorder->push(2);
    }
    EXPECT_EQ(drain(), std::vector<int>{2});
}

}  // namespace
