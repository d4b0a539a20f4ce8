// The audio thread fills slots of the ring (`push`) and the event thread empties them (`take`). A
// slot belongs to one of them at a time, and which one is a matter of the counters under the mutex,
// so the bytes themselves are copied outside it. The audio thread allocates nothing and waits for
// nobody but the mutex, which the other side holds for a few instructions only. If the event thread
// falls behind by the whole ring, recording ends with an error: sound with a hole in it would be
// recognised as something else.
#include "core/sound/CaptureQueue.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace Sound {

namespace {

std::unique_ptr<unsigned char[]> makeRing(std::size_t slots, const RecorderFormat& format) {
    // Not initialised, as by make_unique: that would touch every page.
    return std::unique_ptr<unsigned char[]>(
        format.isUsable() ? new unsigned char[slots * format.getByteCount()] : nullptr);
}

}  // namespace

CaptureQueue::CaptureQueue(const RecorderFormat& bufferFormat, std::function<void()> wakeFunction)
    : format(bufferFormat), wake(std::move(wakeFunction)), ring(makeRing(SLOTS, bufferFormat)) {}

bool CaptureQueue::push(const unsigned char* data, std::size_t size) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (ended) {
            return false;
        }
        ++arrivals;
    }
    const std::size_t bufferSize = format.getByteCount();
    while (ring && size > 0) {
        const std::size_t count = std::min(size, bufferSize - filled);
        if (data != nullptr) {
            std::memcpy(slot(filling) + filled, data, count);
            data += count;
        } else {
            std::memset(slot(filling) + filled, 0, count);
        }
        filled += count;
        size -= count;
        if (filled == bufferSize && !finishSlot()) {
            return false;
        }
    }
    return true;
}

void CaptureQueue::fail(const std::string& what) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (ended) {
            return;
        }
        ended = true;
        failed = true;
        reason = what;
    }
    callWake();
}

// What throws changes nothing: the sound still waits, and the next piece of it wakes again.
const CaptureQueue::Batch& CaptureQueue::take() {
    std::size_t count = 0;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        awake = false;
        count = waiting;
    }
    batch.buffers.clear();
    for (std::size_t i = 0; i < count; ++i) {
        const boost::shared_ptr<SoundDataBuffer> buffer = pool.take(format.getInfo());
        const unsigned char* const bytes = slot(taking + i);
        buffer->getData().assign(bytes, bytes + format.getByteCount());
        batch.buffers.push_back(buffer);
    }
    const std::lock_guard<std::mutex> lock(mutex);
    taking += count;
    waiting -= count;
    // Sound that has come in between comes before the failure.
    batch.failed = waiting == 0 && std::exchange(failed, false);
    batch.reason = batch.failed ? reason : std::string();
    return batch;
}

unsigned CaptureQueue::getArrivalCount() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return arrivals;
}

bool CaptureQueue::finishSlot() {
    bool full = false;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        full = waiting >= BUFFERS_MAX;
        waiting += full ? 0 : 1;
    }
    if (full) {
        fail("recorded sound was not taken in time");
        return false;
    }
    ++filling;
    filled = 0;
    callWake();
    return true;
}

void CaptureQueue::callWake() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (awake) {
            return;
        }
        awake = true;
    }
    wake();
}

}  // namespace Sound
