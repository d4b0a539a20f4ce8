/**
 * @file
 * Base64 with the standard alphabet.
 */
#pragma once

#include <string>
#include <vector>

#include "core/Export.h"

namespace Util {

/** Base64 of RFC 4648 with padding. Stateless; any thread. */
class KORVEL_CORE_API Base64Coder {
  public:
    /** Encodes with padding and without line ends. */
    static std::string encode(const std::vector<unsigned char>& bytes);

    /**
     * Decodes strictly: the length must be a multiple of four, padding stands only at the end, no
     * white space, no other character, unused bits zero. The empty text gives no bytes.
     * @param[out] bytes  the decoded bytes; empty after a failure
     * @return false when the text is not valid
     */
    static bool decode(const std::string& text, std::vector<unsigned char>& bytes);
};

}  // namespace Util
