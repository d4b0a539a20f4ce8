/**
 * @file
 * Encodes sound off the event thread, in order.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <deque>
#include <functional>
#include <utility>

#include "core/sound/Encoder.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/SessionObserver.h"
#include "talvox/impl/ParallelEncoderTask.h"
#include "talvox/impl/RecognizeRequest.h"

namespace Talvox {

/**
 * Encodes buffers on the task workers, one at a time and in the order in which they were written,
 * and hands the encoded bytes on: piece by piece into an open request (writer mode), or in one
 * piece to a callback once the stream is closed (callback mode).
 *
 * Used under the event lock only; no operation waits for a worker.
 */
class ParallelEncoder {
  public:
    using Callback = std::function<void(boost::shared_ptr<const Sound::SoundDataBuffer>)>;

    /** Writer mode: the encoded bytes go to the request, which is closed at the end. */
    ParallelEncoder(boost::shared_ptr<Sound::Encoder> target,
                    boost::shared_ptr<RecognizeRequest> destination);

    /**
     * Callback mode.
     * @param whenClosed gets the whole encoded stream, without any bytes when no sound was ever
     *                   written; may destroy the parallel encoder
     */
    ParallelEncoder(boost::shared_ptr<Sound::Encoder> target, Callback whenClosed);

    ParallelEncoder(const ParallelEncoder&) = delete;
    ParallelEncoder& operator=(const ParallelEncoder&) = delete;

    /** Cancels the task in flight. */
    ~ParallelEncoder();

    /** Queues a buffer. */
    void write(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer);

    /** No buffer follows; the output is handed on once all buffers are encoded. */
    void closeWrite();

    /** Gives up the task in flight; what is left is to drop the parallel encoder. */
    void cancel();

    /**
     * Sets what is called, once, when sound is lost because there is no memory or thread to encode
     * it; it may destroy the parallel encoder. The request is not closed then. Without it, the
     * callback mode ends with a stream without bytes.
     */
    void setFailureCallback(std::function<void()> whenFailed) { onFailure = std::move(whenFailed); }

    /** Sets what observes the encoding; null for nothing. */
    void setObserver(const boost::shared_ptr<SessionObserver>& sessionObserver) {
        observer = sessionObserver;
    }

    /**
     * The task in flight has encoded its buffer; for the task.
     * @param encoded false when encoding threw
     */
    void taskDone(bool encoded);

  private:
    void taskQueueStep();
    void startNextTask();
    void finishStream();
    void giveUp();
    bool hasLostSound() const { return encoder && encoder->hasFailed(); }
    void reportOutput(const Sound::SoundDataBuffer* output, bool isLast);
    void callBack(const boost::shared_ptr<Sound::SoundDataBuffer>& output);

    boost::shared_ptr<Sound::Encoder> encoder;
    bool wroteAny = false;
    Callback callback;
    boost::shared_ptr<RecognizeRequest> request;
    std::deque<boost::shared_ptr<const Sound::SoundDataBuffer>> queue;
    boost::shared_ptr<ParallelEncoderTask> currentTask;
    bool closed = false;
    bool failed = false;
    std::function<void()> onFailure;
    /** The last task that has completed, to be used again. */
    boost::shared_ptr<ParallelEncoderTask> spareTask;
    boost::shared_ptr<SessionObserver> observer;
};

}  // namespace Talvox
