#include "gateway/DecoderPool.h"

#include <algorithm>
#include <chrono>

#include "pal/kd_log.h"

namespace Gateway {

DecoderPool::DecoderPool(const SpeechModel& speechModel, std::size_t maxDecoders,
                         unsigned maxWaitMs)
    : model(speechModel), limit(std::max<std::size_t>(1, maxDecoders)), waitMs(maxWaitMs) {}

DecoderPool::~DecoderPool() {
    close();
}

bool DecoderPool::load() {
    return tryAcquire() != nullptr;
}

DecoderPool::Lease DecoderPool::tryAcquire() {
    std::unique_lock<std::mutex> lock(mutex);
    if (closed || !waiting.empty() || !isAvailable()) {
        return Lease();
    }
    return take(lock);
}

DecoderPool::Lease DecoderPool::acquire() {
    std::unique_lock<std::mutex> lock(mutex);
    const auto place = waiting.insert(waiting.end(), 0);
    const bool served = changed.wait_for(lock, std::chrono::milliseconds(waitMs), [&] {
        return closed || (place == waiting.begin() && isAvailable());
    });
    waiting.erase(place);
    changed.notify_all();
    if (!served || closed) {
        return Lease();
    }
    return take(lock);
}

void DecoderPool::close() {
    const std::lock_guard<std::mutex> lock(mutex);
    closed = true;
    changed.notify_all();
}

bool DecoderPool::isClosed() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return closed;
}

std::size_t DecoderPool::getWaiting() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return waiting.size();
}

DecoderPool::Lease DecoderPool::take(std::unique_lock<std::mutex>& lock) {
    if (!idle.empty()) {
        std::unique_ptr<SpeechDecoder> decoder = std::move(idle.back());
        idle.pop_back();
        return lend(std::move(decoder));
    }
    ++created;
    lock.unlock();
    std::unique_ptr<SpeechDecoder> decoder;
    {
        const std::lock_guard<std::mutex> loadingLock(loading);
        decoder = SpeechDecoder::create(model);
    }
    if (!decoder) {
        kdLogFormatMessage("the decoder cannot load its model");
        lock.lock();
        --created;
        changed.notify_all();
        return Lease();
    }
    return lend(std::move(decoder));
}

DecoderPool::Lease DecoderPool::lend(std::unique_ptr<SpeechDecoder> decoder) {
    return Lease(decoder.release(), [this](SpeechDecoder* returned) { giveBack(returned); });
}

void DecoderPool::giveBack(SpeechDecoder* decoder) {
    decoder->abandon();
    const std::lock_guard<std::mutex> lock(mutex);
    idle.emplace_back(decoder);
    changed.notify_all();
}

}  // namespace Gateway
