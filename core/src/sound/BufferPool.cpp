#include "core/sound/BufferPool.h"

#include <boost/make_shared.hpp>

namespace Sound {

// The count is read with acquire semantics: what the last owner did to the buffer came before.
boost::shared_ptr<SoundDataBuffer> BufferPool::take(const SoundDataInfo& info) {
    for (std::size_t i = 0; i < buffers.size(); ++i) {
        next = next + 1 < buffers.size() ? next + 1 : 0;
        if (buffers[next].use_count() == 1) {
            buffers[next]->getInfo() = info;
            return buffers[next];
        }
    }
    boost::shared_ptr<SoundDataBuffer> buffer = boost::make_shared<SoundDataBuffer>(info);
    if (buffers.size() < BUFFERS_MAX) {
        buffers.push_back(buffer);
    }
    return buffer;
}

}  // namespace Sound
