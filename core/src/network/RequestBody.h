#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>

#include "core/network/HttpRequest.h"

namespace Network {

/** Reads the body of a request from its beginning, whole or streamed. One thread. */
class RequestBody {
  public:
    enum class State { BYTES, NOTHING_YET, END };

    explicit RequestBody(boost::shared_ptr<HttpRequest> owner);

    /** Copies what is there, up to `maxSize` bytes; `size` is above 0 exactly with `BYTES`. */
    State read(void* data, std::size_t maxSize, std::size_t& size);

    void seek(std::size_t position) { offset = position; }

  private:
    State readStream(void* data, std::size_t maxSize, std::size_t& size);

    const boost::shared_ptr<HttpRequest> request;
    std::size_t offset = 0;
};

}  // namespace Network
