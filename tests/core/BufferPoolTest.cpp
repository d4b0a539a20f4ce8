#include "core/sound/BufferPool.h"

#include <gtest/gtest.h>

#include <boost/weak_ptr.hpp>
#include <set>
#include <vector>

namespace {

using Sound::BufferPool;
using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;

const SoundDataInfo FORMAT(SoundDataInfo::NONE, 1, 16000, 2, 1600);

using Buffers = std::vector<boost::shared_ptr<SoundDataBuffer>>;

Buffers takeMany(BufferPool& pool, std::size_t count) {
    Buffers buffers;
    for (std::size_t i = 0; i < count; ++i) {
        buffers.push_back(pool.take(FORMAT));
    }
    return buffers;
}

TEST(BufferPool, UsesAReleasedBufferAgain) {
    BufferPool pool;
    boost::shared_ptr<SoundDataBuffer> buffer = pool.take(FORMAT);
    buffer->getData().assign(3200, 7);
    const SoundDataBuffer* const first = buffer.get();
    buffer.reset();
    buffer = pool.take(SoundDataInfo(SoundDataInfo::SPEEX, 1, 8000, 2));
    EXPECT_EQ(buffer.get(), first);
    EXPECT_EQ(buffer->getInfo().getCodec(), SoundDataInfo::SPEEX);
    EXPECT_EQ(buffer->getInfo().getSampleRate(), 8000);
    EXPECT_EQ(buffer->getInfo().getSampleCount(), -1);
}

TEST(BufferPool, LeavesABufferAloneWhileSomebodyHoldsIt) {
    BufferPool pool;
    const boost::shared_ptr<const SoundDataBuffer> held = pool.take(FORMAT);
    for (std::size_t i = 0; i < 3 * BufferPool::BUFFERS_MAX; ++i) {
        EXPECT_NE(pool.take(FORMAT), held);
    }
}

TEST(BufferPool, HandsOutAsManyAsAreAskedFor) {
    BufferPool pool;
    const Buffers buffers = takeMany(pool, 3 * BufferPool::BUFFERS_MAX);
    EXPECT_EQ(std::set<boost::shared_ptr<SoundDataBuffer>>(buffers.begin(), buffers.end()).size(),
              buffers.size());
}

TEST(BufferPool, KeepsNoMoreThanItsBound) {
    BufferPool pool;
    Buffers buffers = takeMany(pool, 3 * BufferPool::BUFFERS_MAX);
    const std::vector<boost::weak_ptr<SoundDataBuffer>> traces(buffers.begin(), buffers.end());
    buffers.clear();
    std::size_t kept = 0;
    for (const auto& trace : traces) {
        kept += trace.expired() ? 0 : 1;
    }
    EXPECT_EQ(kept, BufferPool::BUFFERS_MAX);
}

TEST(BufferPool, MayEndBeforeItsBuffers) {
    boost::shared_ptr<SoundDataBuffer> buffer;
    {
        BufferPool pool;
        buffer = pool.take(FORMAT);
        buffer->getData().assign(3200, 7);
    }
    EXPECT_EQ(buffer->getData(), std::vector<unsigned char>(3200, 7));
}

}  // namespace
