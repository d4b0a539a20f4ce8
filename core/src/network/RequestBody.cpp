#include "network/RequestBody.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace Network {

RequestBody::RequestBody(boost::shared_ptr<HttpRequest> owner) : request(std::move(owner)) {}

RequestBody::State RequestBody::read(void* data, std::size_t maxSize, std::size_t& size) {
    if (request->isChunked()) {
        return readStream(data, maxSize, size);
    }
    const std::string& body = request->getBody();
    size = std::min(maxSize, body.size() - std::min(offset, body.size()));
    if (size == 0) {
        return State::END;
    }
    std::memcpy(data, body.data() + offset, size);
    offset += size;
    return State::BYTES;
}

RequestBody::State RequestBody::readStream(void* data, std::size_t maxSize, std::size_t& size) {
    const NetworkTaskWriter& writer = *request->getWriter();
    // Asked before reading: what is written in between must not be taken for the end.
    const bool closed = writer.isClosed();
    size = writer.read(offset, data, maxSize);
    offset += size;
    if (size > 0) {
        return State::BYTES;
    }
    return closed ? State::END : State::NOTHING_YET;
}

}  // namespace Network
