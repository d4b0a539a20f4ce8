#include "core/network/NetworkTaskWriter.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstring>
#include <limits>
#include <utility>

namespace Network {

NetworkTaskWriter::NetworkTaskWriter() = default;

NetworkTaskWriter::~NetworkTaskWriter() = default;

int NetworkTaskWriter::write(const void* data, std::size_t size) {
    boost::shared_ptr<const std::function<void()>> notify;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (closed || size > static_cast<std::size_t>(std::numeric_limits<int>::max())) {
            return -1;
        }
        if (size > 0) {
            body.append(static_cast<const char*>(data), size);
            notify = onChange;
        }
    }
    if (notify) {
        (*notify)();
    }
    return static_cast<int>(size);
}

void NetworkTaskWriter::close() {
    boost::shared_ptr<const std::function<void()>> notify;
    {
        const std::lock_guard<std::mutex> lock(mutex);
        if (!closed) {
            closed = true;
            notify = onChange;
        }
    }
    if (notify) {
        (*notify)();
    }
}

bool NetworkTaskWriter::isClosed() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return closed;
}

std::size_t NetworkTaskWriter::getSize() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return body.size();
}

std::size_t NetworkTaskWriter::read(std::size_t offset, void* data, std::size_t maxSize) const {
    const std::lock_guard<std::mutex> lock(mutex);
    if (offset >= body.size()) {
        return 0;
    }
    const std::size_t count = std::min(maxSize, body.size() - offset);
    std::memcpy(data, body.data() + offset, count);
    return count;
}

void NetworkTaskWriter::setWakeUp(std::function<void()> wakeUp) {
    boost::shared_ptr<const std::function<void()>> next;
    if (wakeUp) {
        next = boost::make_shared<const std::function<void()>>(std::move(wakeUp));
    }
    // The old function dies outside the lock: it may hold the last reference to a transfer.
    const std::lock_guard<std::mutex> lock(mutex);
    onChange.swap(next);
}

}  // namespace Network
