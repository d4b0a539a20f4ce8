/**
 * @file
 * Percent encoding.
 */
#pragma once

#include <string>

#include "core/Export.h"

namespace Util {

/** Percent encoding of query values. Stateless; any thread. */
class KORVEL_CORE_API UrlCoder {
  public:
    /**
     * Encodes every byte except letters, digits, "-", "_", "." and "~" as "%XX" with capital
     * hexadecimal digits. Any byte, zero included, is accepted.
     */
    static std::string urlEncodeString(const std::string& text);

    /** The inverse; "+" stays a plus and a "%" without two hexadecimal digits stays as it is. */
    static std::string urlDecodeString(const std::string& text);
};

}  // namespace Util
