#include "gateway/BodyPump.h"

#include <utility>

namespace Gateway {

namespace {

/** A client may send a byte at a time. */
std::size_t weigh(const std::string& piece) {
    return sizeof(std::string) + piece.size();
}

}  // namespace

BodyPump::BodyPump(Consumer pieceConsumer, std::size_t maxWaiting)
    : consumer(std::move(pieceConsumer)), limit(maxWaiting), worker([this] { run(); }) {}

BodyPump::~BodyPump() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        isStopped = true;
    }
    changed.notify_all();
    worker.join();
}

void BodyPump::push(const char* data, std::size_t size) {
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return waitingBytes < limit || failure; });
    rethrow();
    waiting.emplace_back(data, size);
    waitingBytes += weigh(waiting.back());
    changed.notify_all();
}

void BodyPump::finish() {
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return (waiting.empty() && !isBusy) || failure; });
    rethrow();
}

void BodyPump::run() {
    std::unique_lock<std::mutex> lock(mutex);
    while (true) {
        changed.wait(lock, [this] { return isStopped || !waiting.empty(); });
        if (isStopped) {
            return;
        }
        const std::string piece = std::move(waiting.front());
        waiting.pop_front();
        waitingBytes -= weigh(piece);
        isBusy = true;
        lock.unlock();
        try {
            consumer(piece);
            lock.lock();
        } catch (...) {
            lock.lock();
            failure = std::current_exception();
            isStopped = true;
        }
        isBusy = false;
        changed.notify_all();
    }
}

void BodyPump::rethrow() const {
    if (failure) {
        std::rethrow_exception(failure);
    }
}

}  // namespace Gateway
