#pragma once

#include <condition_variable>
#include <cstddef>
#include <functional>
#include <list>
#include <memory>
#include <mutex>
#include <vector>

#include "gateway/SpeechDecoder.h"

namespace Gateway {

/**
 * The recognisers that all requests share. Each is loaded when it is first needed; who waits for
 * one gets it in the order of waiting. All operations may be called on any thread.
 */
class DecoderPool {
  public:
    /** A recogniser on loan; giving it back is its destruction. */
    using Lease = std::unique_ptr<SpeechDecoder, std::function<void(SpeechDecoder*)>>;

    DecoderPool(const SpeechModel& speechModel, std::size_t maxDecoders);
    ~DecoderPool();
    DecoderPool(const DecoderPool&) = delete;
    DecoderPool& operator=(const DecoderPool&) = delete;

    const SpeechModel& getModel() const { return model; }

    /** Loads the first recogniser. @return false when the model cannot be loaded */
    bool load();

    /** A recogniser if one is free and nobody waits for it, else null. May load the model. */
    Lease tryAcquire();

    /** Waits for a recogniser, `timeoutMs` at most. @return null after that, or once closed */
    Lease acquire(unsigned timeoutMs);

    /** Ends all waiting; from now on nobody gets a recogniser. */
    void close();

    bool isClosed() const;

    /** Threads that wait for a recogniser at the moment. */
    std::size_t getWaiting() const;

  private:
    bool isAvailable() const { return !idle.empty() || created < limit; }
    Lease take(std::unique_lock<std::mutex>& lock);
    Lease lend(std::unique_ptr<SpeechDecoder> decoder);
    void giveBack(SpeechDecoder* decoder);

    const SpeechModel model;
    const std::size_t limit;
    mutable std::mutex mutex;
    std::condition_variable changed;
    std::vector<std::unique_ptr<SpeechDecoder>> idle;
    std::size_t created = 0;
    bool closed = false;
    /** One entry per waiting thread, the longest waiting first. */
    std::list<int> waiting;
    /** Held while a model is loaded: the recogniser does not promise to load two at once. */
    std::mutex loading;
};

}  // namespace Gateway
