/**
 * @file
 * Feeds the body of a streamed request.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <functional>
#include <mutex>
#include <string>

#include "core/Export.h"

namespace Network {

/**
 * The body of a streamed request while it is being written. Everything written is kept until the
 * writer is destroyed, so that each attempt sends the body from its beginning and then follows the
 * writing. Any thread; no operation waits for the network.
 */
class KORVEL_CORE_API NetworkTaskWriter {
  public:
    NetworkTaskWriter();
    NetworkTaskWriter(const NetworkTaskWriter&) = delete;
    NetworkTaskWriter& operator=(const NetworkTaskWriter&) = delete;
    ~NetworkTaskWriter();

    /** Appends bytes. @return `size`, or -1 once the writer is closed */
    int write(const void* data, std::size_t size);

    /** Ends the body; further writes are refused. Repeated calls do nothing. */
    void close();

    /** Whether `close` was called. */
    bool isClosed() const;

    /** Bytes written so far. */
    std::size_t getSize() const;

    /**
     * Copies up to `maxSize` bytes from `offset` on. @return the number copied; 0 when nothing has
     * been written there yet
     */
    std::size_t read(std::size_t offset, void* data, std::size_t maxSize) const;

    /**
     * Sets what is called after each `write` and `close`, on the writing thread and without any
     * lock of the writer held; empty for nothing. For the transport.
     */
    void setWakeUp(std::function<void()> wakeUp);

  private:
    mutable std::mutex mutex;
    std::string body;
    bool closed = false;
    // Shared, so that each write can call it without the lock and without a copy.
    boost::shared_ptr<const std::function<void()>> onChange;
};

}  // namespace Network
