// A recorder that hands out buffers when it is told to, as fast as the benchmark wants.
#pragma once

#include <boost/make_shared.hpp>
#include <cstdint>
#include <cstring>
#include <utility>
#include <vector>

#include "core/sound/Recorder.h"
#include "core/util/EventLock.h"

namespace Bench {

class BenchRecorder : public Sound::Recorder {
  public:
    /** The one made last; null before the first session. */
    static boost::shared_ptr<BenchRecorder>& current() {
        static boost::shared_ptr<BenchRecorder> recorder;
        return recorder;
    }

    /** Makes the engine record from here. */
    static void install() {
        Sound::Recorder::setFactory([] {
            current() = boost::make_shared<BenchRecorder>();
            return current();
        });
    }

    bool init() override { return true; }

    /** Delivers one buffer as the event thread would. @return false once recording has ended */
    bool deliver(const int16_t* samples, std::size_t count) {
        Util::EventLock lock;
        if (!isRecording()) {
            return false;
        }
        const Sound::SoundDataInfo info(Sound::SoundDataInfo::NONE, 1, getSampleRate(), 2,
                                        static_cast<int>(count));
        std::vector<unsigned char> bytes(count * 2);
        std::memcpy(bytes.data(), samples, bytes.size());
        notifyData(boost::make_shared<Sound::SoundDataBuffer>(info, std::move(bytes)));
        return isRecording();
    }
};

}  // namespace Bench
