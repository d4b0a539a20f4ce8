/**
 * @file
 * A piece of sound.
 */
#pragma once

#include <utility>
#include <vector>

#include "core/sound/SoundDataInfo.h"

namespace Sound {

/**
 * A format and the bytes that it describes; copyable. The format's sample count is what the maker
 * of the buffer claims; readers of samples must not trust it beyond the bytes that are there.
 */
class SoundDataBuffer {
  public:
    /** A buffer without bytes, or with the given ones. */
    explicit SoundDataBuffer(const SoundDataInfo& format) : info(format) {}
    SoundDataBuffer(const SoundDataInfo& format, std::vector<unsigned char> bytes)
        : info(format), data(std::move(bytes)) {}

    /** The format. */
    const SoundDataInfo& getInfo() const { return info; }
    SoundDataInfo& getInfo() { return info; }
    /** The bytes, in the format's own order. */
    const std::vector<unsigned char>& getData() const { return data; }
    std::vector<unsigned char>& getData() { return data; }

    /**
     * Samples per channel: the format's count, or what the bytes hold where the format does not
     * say; 0 where neither can be told.
     */
    int getSampleCount() const {
        if (info.getSampleCount() >= 0) {
            return info.getSampleCount();
        }
        if (info.getChannelCount() <= 0 || info.getSampleSize() <= 0) {
            return 0;
        }
        return static_cast<int>(data.size() / static_cast<unsigned>(info.getChannelCount()) /
                                static_cast<unsigned>(info.getSampleSize()));
    }

  private:
    SoundDataInfo info;
    std::vector<unsigned char> data;
};

}  // namespace Sound
