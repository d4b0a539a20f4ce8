#include "core/sound/CaptureQueue.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <utility>

namespace Sound {

CaptureQueue::CaptureQueue(const RecorderFormat& bufferFormat, std::function<void()> wakeFunction)
    : format(bufferFormat), wake(std::move(wakeFunction)) {}

bool CaptureQueue::push(const unsigned char* data, std::size_t size) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (ended) {
            return false;
        }
        ++arrivals;
    }
    const std::size_t bufferSize = format.getByteCount();
    while (size > 0) {
        const std::size_t count = std::min(size, bufferSize - partial.size());
        if (data != nullptr) {
            partial.insert(partial.end(), data, data + count);
            data += count;
        } else {
            partial.resize(partial.size() + count, 0);
        }
        size -= count;
        if (partial.size() == bufferSize) {
            std::vector<unsigned char> bytes;
            bytes.reserve(bufferSize);
            bytes.swap(partial);
            if (!store(boost::make_shared<SoundDataBuffer>(format.getInfo(), std::move(bytes)))) {
                return false;
            }
        }
    }
    return true;
}

void CaptureQueue::fail(const std::string& reason) {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (ended) {
            return;
        }
        ended = true;
        waiting.failed = true;
        waiting.reason = reason;
    }
    callWake();
}

CaptureQueue::Batch CaptureQueue::take() {
    const std::lock_guard<std::mutex> lock(mutex);
    awake = false;
    return std::exchange(waiting, Batch());
}

unsigned CaptureQueue::getArrivalCount() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return arrivals;
}

bool CaptureQueue::store(boost::shared_ptr<const SoundDataBuffer> buffer) {
    bool full = false;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        full = waiting.buffers.size() >= BUFFERS_MAX;
        if (!full) {
            waiting.buffers.push_back(std::move(buffer));
        }
    }
    if (full) {
        fail("recorded sound was not taken in time");
        return false;
    }
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
