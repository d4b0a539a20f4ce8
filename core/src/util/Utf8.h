#pragma once

#include <string>

namespace Util {

/** Whether the bytes are UTF-8 in its shortest form, without surrogates and zero bytes. */
bool isUtf8Text(const std::string& bytes);

}  // namespace Util
