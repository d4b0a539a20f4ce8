#include "gateway/LogText.h"

#include <cstddef>
#include <cstdio>

namespace Gateway {

std::string toLogText(const std::string& text) {
    constexpr std::size_t MAX_BYTES = 300;
    if (text.empty()) {
        return "-";
    }
    std::string printable;
    for (const char c : text.substr(0, MAX_BYTES)) {
        const unsigned code = static_cast<unsigned char>(c);
        if (code < 0x20 || code > 0x7e || c == '\\' || c == '"') {
            char escaped[8];
            std::snprintf(escaped, sizeof(escaped), "\\x%02x", code);
            printable += escaped;
        } else {
            printable += c;
        }
    }
    if (text.size() > MAX_BYTES) {
        printable += "...";
    }
    return printable.find(' ') == std::string::npos ? printable : "\"" + printable + "\"";
}

}  // namespace Gateway
