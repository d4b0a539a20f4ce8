/**
 * @file
 * A recorder whose device hangs.
 */
#pragma once

#include <unistd.h>

#include <array>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <future>
#include <memory>
#include <thread>
#include <vector>

#include "core/sound/QueuedRecorder.h"

namespace TearDown {

/** Delivers a second of sound; then its thread reads from a pipe that nobody ever writes to. */
class HangingRecorder : public Sound::QueuedRecorder {
  public:
    HangingRecorder() : QueuedRecorder("HangingRecorder") {}
    ~HangingRecorder() override { QueuedRecorder::stopRecording(); }

    /** Waits until all its sound is in the queue and the device hangs. Once. */
    void waitUntilHanging() { hanging->get_future().wait(); }

  protected:
    bool openDevice(const Sound::RecorderFormat& format,
                    const boost::shared_ptr<Sound::CaptureQueue>& target) override {
        byteCount = format.getByteCount();
        queue = target;
        return true;
    }

    void beginDevice() override {
        std::thread(&HangingRecorder::hang, queue, byteCount, hanging).detach();
    }

    void endDevice() override { queue.reset(); }

  private:
    static void hang(const boost::shared_ptr<Sound::CaptureQueue>& target, std::size_t size,
                     const std::shared_ptr<std::promise<void>>& reached) {
        constexpr int BUFFERS = 10;
        const std::vector<unsigned char> sound(size, 1);
        for (int i = 0; i < BUFFERS; ++i) {
            target->push(sound.data(), sound.size());
        }
        std::array<int, 2> ends = {-1, -1};
        if (::pipe(ends.data()) != 0) {
            return;
        }
        reached->set_value();
        unsigned char byte = 0;
        while (::read(ends[0], &byte, 1) > 0) {
        }
    }

    const std::shared_ptr<std::promise<void>> hanging = std::make_shared<std::promise<void>>();
    boost::shared_ptr<Sound::CaptureQueue> queue;
    std::size_t byteCount = 0;
};

}  // namespace TearDown
