#include "util/XmlEncoding.h"

#include <algorithm>
#include <cstddef>

#include "core/util/Ascii.h"
#include "pal/kd_log.h"
#include "util/Utf8.h"

namespace Util {

namespace {

/** Characters of windows-1251 from byte 0x80 on; the letters from 0xC0 on have a rule. */
constexpr char16_t WINDOWS_1251[] = {
    0x0402, 0x0403, 0x201A, 0x0453, 0x201E, 0x2026, 0x2020, 0x2021, 0x20AC, 0x2030, 0x0409,
    0x2039, 0x040A, 0x040C, 0x040B, 0x040F, 0x0452, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x0098, 0x2122, 0x0459, 0x203A, 0x045A, 0x045C, 0x045B, 0x045F, 0x00A0,
    0x040E, 0x045E, 0x0408, 0x00A4, 0x0490, 0x00A6, 0x00A7, 0x0401, 0x00A9, 0x0404, 0x00AB,
    0x00AC, 0x00AD, 0x00AE, 0x0407, 0x00B0, 0x00B1, 0x0406, 0x0456, 0x0491, 0x00B5, 0x00B6,
    0x00B7, 0x0451, 0x2116, 0x0454, 0x00BB, 0x0458, 0x0405, 0x0455, 0x0457};

/** Characters of windows-1252 from byte 0x80 on; those from 0xA0 on are ISO-8859-1. */
constexpr char16_t WINDOWS_1252[] = {
    0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, 0x008D, 0x017D, 0x008F, 0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178};

char16_t fromLatin1(unsigned char byte) {
    return byte;
}

char16_t fromWindows1251(unsigned char byte) {
    if (byte >= 0xC0) {
        return static_cast<char16_t>(byte - 0xC0 + 0x0410);
    }
    return byte < 0x80 ? byte : WINDOWS_1251[byte - 0x80];
}

char16_t fromWindows1252(unsigned char byte) {
    return byte < 0x80 || byte >= 0xA0 ? byte : WINDOWS_1252[byte - 0x80];
}

using Conversion = char16_t (*)(unsigned char);

struct Row {
    const char* name; /**< without "-" and "_", in lower case */
    Conversion conversion;
    bool isFamily; /**< stands for all encodings whose names begin so, for want of their tables */
};

const Row ROWS[] = {
    {"windows1251", fromWindows1251, false},
    {"cp1251", fromWindows1251, false},
    {"windows1252", fromWindows1252, false},
    {"cp1252", fromWindows1252, false},
    {"iso88591", fromLatin1, false},
    {"latin1", fromLatin1, false},
    {"iso8859", fromLatin1, true},
    {"latin", fromLatin1, true},
    {"windows125", fromLatin1, true},
    {"windows874", fromLatin1, true},
    {"cp125", fromLatin1, true},
    {"cp8", fromLatin1, true},
    {"ibm8", fromLatin1, true},
    {"koi8", fromLatin1, true},
};

/** The encoding's name in the declaration that the text begins with; empty without one. */
std::string declaredEncoding(const std::string& xml) {
    if (xml.compare(0, 5, "<?xml") != 0) {
        return std::string();
    }
    const std::string declaration = xml.substr(0, xml.find("?>"));
    const std::size_t name = declaration.find("encoding");
    const std::size_t begin = declaration.find_first_of("\"'", name);
    if (name == std::string::npos || begin == std::string::npos) {
        return std::string();
    }
    const std::size_t end = declaration.find(declaration[begin], begin + 1);
    return end == std::string::npos ? std::string()
                                    : declaration.substr(begin + 1, end - begin - 1);
}

const Row* findRow(const std::string& encoding) {
    std::string name;
    for (const char c : encoding) {
        if (c != '-' && c != '_') {
            name += toLower(c);
        }
    }
    const Row* const found =
        std::find_if(std::begin(ROWS), std::end(ROWS), [&name](const Row& row) {
            return row.isFamily ? name.rfind(row.name, 0) == 0 : name == row.name;
        });
    return found == std::end(ROWS) ? nullptr : found;
}

}  // namespace

std::string xmlToUtf8(const std::string& xml) {
    const std::size_t valid = utf8PrefixLength(xml);
    if (valid == xml.size() || xml[valid] == '\0') {
        return xml;
    }
    const std::string encoding = declaredEncoding(xml);
    const Row* const row = findRow(encoding);
    if (row == nullptr) {
        return xml;
    }
    if (row->isFamily) {
        kdLogFormatMessage("XmlUtils: reading encoding %.32s as ISO-8859-1", encoding.c_str());
    }
    std::string text;
    text.reserve(xml.size() + xml.size() / 2);
    for (const char c : xml) {
        appendUtf8(text, row->conversion(static_cast<unsigned char>(c)));
    }
    return text;
}

}  // namespace Util
