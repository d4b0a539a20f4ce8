/**
 * @file
 * Hands sound from a device's thread to the event thread; for recorders of a platform.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "core/Export.h"
#include "core/sound/BufferPool.h"
#include "core/sound/RecorderFormat.h"
#include "core/sound/SoundDataBuffer.h"

namespace Sound {

/**
 * What a device's thread hands to the event thread: sound, cut into buffers of the asked length,
 * and at most one failure, behind all sound that came before it.
 *
 * The device's thread copies into a ring that is there from the beginning: it allocates nothing,
 * however late the event thread takes the sound. The event thread makes the buffers.
 */
class KORVEL_CORE_API CaptureQueue {
  public:
    /** The most buffers that wait; one more is a failure, because sound would be lost. */
    static constexpr std::size_t BUFFERS_MAX = 64;

    /** What the event thread takes at once. */
    struct Batch {
        /** Full buffers, in order. */
        std::vector<boost::shared_ptr<const SoundDataBuffer>> buffers;
        /** No sound follows the buffers. */
        bool failed = false;
        /** Of the failure; empty without one. */
        std::string reason;
    };

    /**
     * @param wake called on the device's thread, without a lock, when there is something to take
     *             and it was not yet called since the last `take`
     */
    CaptureQueue(const RecorderFormat& format, std::function<void()> wake);
    CaptureQueue(const CaptureQueue&) = delete;
    CaptureQueue& operator=(const CaptureQueue&) = delete;

    /**
     * Appends sound. Device's thread.
     * @param data whole 16-bit samples; null for silence
     * @return false when it failed, now or before; no more sound is taken then
     */
    bool push(const unsigned char* data, std::size_t size);

    /** Appends a failure; the first one counts. Device's thread, or before it has begun. */
    void fail(const std::string& reason);

    /** What has come since the last call, valid until the next one. Event thread. */
    const Batch& take();

    /** Grows whenever sound comes; wraps around. Any thread. */
    unsigned getArrivalCount() const;

  private:
    /** One more than may wait: the device's thread fills it meanwhile. */
    static constexpr std::size_t SLOTS = BUFFERS_MAX + 1;

    unsigned char* slot(std::size_t index) const {
        return ring.get() + index % SLOTS * format.getByteCount();
    }
    bool finishSlot();
    void callWake();

    const RecorderFormat format;
    const std::function<void()> wake;
    // Pages of it that no sound has reached yet take no memory.
    const std::unique_ptr<unsigned char[]> ring;

    // Of the device's thread.
    std::size_t filling = 0;
    std::size_t filled = 0;

    // Of the event thread.
    BufferPool pool;
    Batch batch;
    std::size_t taking = 0;

    mutable std::mutex mutex;  // guards what follows
    std::size_t waiting = 0;
    std::string reason;
    bool failed = false;
    bool ended = false;
    bool awake = false;
    unsigned arrivals = 0;
};

}  // namespace Sound
