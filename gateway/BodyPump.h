#pragma once

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <exception>
#include <functional>
#include <mutex>
#include <string>
#include <thread>

namespace Gateway {

/**
 * Hands a body to a consumer on a thread of its own, so that the connection is read as the body
 * arrives even while the consumer decodes. The consumer gets the pieces in order. `push`, `finish`
 * and the destructor belong to one thread.
 */
class BodyPump {
  public:
    /** Takes a piece on the pump's thread. An exception ends the pump. */
    using Consumer = std::function<void(const std::string& piece)>;

    /** Room for pieces that wait: 20 s of PCM at 44.1 kHz twice over. */
    static constexpr std::size_t MAX_WAITING_DFLT = std::size_t{4} * 1024 * 1024;

    /**
     * @param pieceConsumer is called until `finish` or the destructor returns
     * @param maxWaiting    bytes of waiting pieces from which on `push` waits for the consumer
     * @throws std::system_error if the system has no thread
     */
    explicit BodyPump(Consumer pieceConsumer, std::size_t maxWaiting = MAX_WAITING_DFLT);
    /** Waits for the call that runs and drops the pieces behind it. */
    ~BodyPump();
    BodyPump(const BodyPump&) = delete;
    BodyPump& operator=(const BodyPump&) = delete;

    /** Takes a piece of the body. Rethrows what the consumer threw. */
    void push(const char* data, std::size_t size);

    /** Waits until the consumer has taken everything. Rethrows what it threw. */
    void finish();

  private:
    void run();
    void rethrow() const;

    const Consumer consumer;
    const std::size_t limit;
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<std::string> waiting;
    /** Bytes that the waiting pieces take, with their own overhead. */
    std::size_t waitingBytes = 0;
    bool isBusy = false;
    bool isStopped = false;
    std::exception_ptr failure;
    std::thread worker;
};

}  // namespace Gateway
