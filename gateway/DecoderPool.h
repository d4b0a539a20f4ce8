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
 * The decoders that all requests share. The pool loads each decoder when it is first needed and
 * serves waiting threads in the order in which they began to wait. All operations may be called on
 * any thread.
 */
class DecoderPool {
  public:
    /**
     * Longest wait for a free decoder. A client that is refused tries again once, 2 s later, and
     * gives up 20 s after its request: both attempts must fit into that.
     */
    static constexpr unsigned WAIT_MS_DFLT = 4000;

    /** A decoder on loan; destroying the lease returns it. */
    using Lease = std::unique_ptr<SpeechDecoder, std::function<void(SpeechDecoder*)>>;

    /**
     * @param speechModel what each decoder loads
     * @param maxDecoders decoders on loan at the same time, at least 1
     * @param maxWaitMs   longest time that `acquire` blocks, in milliseconds
     */
    DecoderPool(const SpeechModel& speechModel, std::size_t maxDecoders,
                unsigned maxWaitMs = WAIT_MS_DFLT);
    ~DecoderPool();
    DecoderPool(const DecoderPool&) = delete;
    DecoderPool& operator=(const DecoderPool&) = delete;

    const SpeechModel& getModel() const { return model; }

    /** Loads the first decoder. @return false when the model cannot be loaded */
    bool load();

    /** A decoder if one is free and no thread waits for it, else null. May load the model. */
    Lease tryAcquire();

    /** Waits for a decoder. @return null after `maxWaitMs`, or once the pool is closed */
    Lease acquire();

    /** Ends all waiting; from now on the pool lends no decoder. */
    void close();

    bool isClosed() const;

    /** Threads that wait for a decoder at the moment. */
    std::size_t getWaiting() const;

  private:
    bool isAvailable() const { return !idle.empty() || created < limit; }
    Lease take(std::unique_lock<std::mutex>& lock);
    Lease lend(std::unique_ptr<SpeechDecoder> decoder);
    void giveBack(SpeechDecoder* decoder);

    const SpeechModel model;
    const std::size_t limit;
    const unsigned waitMs;
    mutable std::mutex mutex;
    std::condition_variable changed;
    std::vector<std::unique_ptr<SpeechDecoder>> idle;
    std::size_t created = 0;
    bool closed = false;
    /** One entry per waiting thread, the longest waiting first. */
    std::list<int> waiting;
    /** Held while a model is loaded: the decoder does not promise to load two at once. */
    std::mutex loading;
};

}  // namespace Gateway
