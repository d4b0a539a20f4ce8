/**
 * @file
 * Runs one network task at a time for its owner.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/Export.h"
#include "core/network/NetworkTask.h"
#include "core/network/NetworkTaskRetryPolicy.h"

namespace Network {

class Exchange;

/**
 * Owns at most one running task. All operations take the event lock and none waits for the
 * network. After `cancel` or the destructor has returned, no operation of the task is called any
 * more and the transfer ends as soon as the network thread notices.
 */
class KORVEL_CORE_API NetworkTaskHolder {
  public:
    /** The thread on which a task's `onFinished` is called; under the event lock in any case. */
    enum class EndThread {
        EVENT,  /**< the event thread, as everything that the engine sees */
        NETWORK /**< the network thread, as the task's other operations: a task that is submitted
                     from `onFinished` follows without a change of threads */
    };

    /** A holder without a task. */
    explicit NetworkTaskHolder(EndThread endThread = EndThread::EVENT);
    NetworkTaskHolder(const NetworkTaskHolder&) = delete;
    NetworkTaskHolder& operator=(const NetworkTaskHolder&) = delete;
    virtual ~NetworkTaskHolder();

    /**
     * Starts a task; the holder keeps it alive until it is over. A task that is still running is
     * cancelled first, with a line in the log.
     */
    void submit(const boost::shared_ptr<NetworkTask>& task,
                const boost::shared_ptr<NetworkTaskRetryPolicy>& policy);

    /** As `submit` with a single attempt. */
    void submitNoRetries(const boost::shared_ptr<NetworkTask>& task);

    /** Ends a running task; does nothing without one. */
    void cancel();

    /** True from `submit` until `onFinished`, `cancel` or the end of the task's `onFinished`. */
    bool isWorking() const;

    /**
     * Releases the task: it is over. Called by the owner from the task's `onFinished`, so that the
     * next task can be submitted from there. While a transfer runs it ends that, as `cancel` does.
     */
    void onFinished();

  private:
    const EndThread thread;
    boost::shared_ptr<Exchange> exchange;
};

}  // namespace Network
