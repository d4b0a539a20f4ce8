/**
 * @file
 * Sound buffers that are used again.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <vector>

#include "core/Export.h"
#include "core/sound/SoundDataBuffer.h"

namespace Sound {

/**
 * Hands out sound buffers and uses them again as soon as nobody else holds them, so that steady
 * sound needs no memory for each buffer. Whoever uses the content of a buffer holds it by shared
 * pointer; a weak one does not keep the content.
 *
 * Used by one thread at a time; the buffers may be released on any thread.
 */
class KORVEL_CORE_API BufferPool {
  public:
    /** The most buffers that are kept. Beyond that, a buffer ends with its last owner. */
    static constexpr std::size_t BUFFERS_MAX = 16;

    BufferPool() = default;
    BufferPool(const BufferPool&) = delete;
    BufferPool& operator=(const BufferPool&) = delete;

    /** A buffer of this format, whose bytes the caller replaces: they are those of an earlier use.
     */
    boost::shared_ptr<SoundDataBuffer> take(const SoundDataInfo& info);

  private:
    std::vector<boost::shared_ptr<SoundDataBuffer>> buffers;
    std::size_t next = 0;
};

}  // namespace Sound
