/**
 * @file
 * Output stream interface.
 */
#pragma once

#include "core/Export.h"

namespace IO {

/** Something that takes bytes. Used by one thread at a time. */
class KORVEL_CORE_API OutputStream {
  public:
    virtual ~OutputStream();

    /**
     * Writes `size` bytes.
     * @return the number of bytes written, which may be less than `size`, or -1 on failure
     */
    virtual int write(const void* data, int size) = 0;
};

}  // namespace IO
