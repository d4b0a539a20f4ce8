#include "core/io/OutputStream.h"

namespace IO {

OutputStream::~OutputStream() = default;

}  // namespace IO
