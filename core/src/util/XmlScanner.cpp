#include "util/XmlScanner.h"

#include <cstdint>

#include "core/util/Ascii.h"

namespace Util {

namespace {

constexpr std::uint32_t LAST_CODE_POINT = 0x10FFFF;

// The parser takes every byte beyond ASCII, and DEL, for a letter.
bool isNameStart(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return isLetter(c) || c == '_' || byte >= 0x7F;
}

bool isNameCharacter(char c) {
    return isNameStart(c) || isDigit(c) || c == '-' || c == '.' || c == ':';
}

bool isXmlCharacter(std::uint32_t code) {
    return code == '\t' || code == '\n' || code == '\r' || (code >= 0x20 && code < 0xD800) ||
           (code >= 0xE000 && code < 0xFFFE) || (code > 0xFFFF && code <= LAST_CODE_POINT);
}

}  // namespace

XmlScanner::XmlScanner(const std::string& xml, unsigned deepest, unsigned mostAttributes)
    : text(xml), maxDepth(deepest), maxAttributes(mostAttributes) {}

std::string XmlScanner::findHazard() {
    Step step = Step::ON;
    while (step == Step::ON && !atEnd()) {
        step = current() == '<' ? scanMarkup() : scanText("<");
    }
    return hazard;
}

std::string XmlScanner::completeElements() const {
    std::string complete = text.substr(0, completeEnd);
    // No element was closed since, so those that were open there still are.
    for (std::size_t i = completeDepth; i > 0; --i) {
        const auto& [begin, length] = openNames[i - 1];
        complete.append("</").append(text, begin, length).append(">");
    }
    return complete;
}

XmlScanner::Step XmlScanner::scanMarkup() {
    if (startsWithNoCase("<?xml")) {
        return scanDeclaration();
    }
    if (startsWith("<!--")) {
        position += 4;
        return skipBehind("-->");
    }
    if (startsWith("<![CDATA[")) {
        position += 9;
        return skipBehind("]]>");
    }
    if (startsWith("</")) {
        return scanClosingTag();
    }
    if (position + 1 < text.size() && isNameStart(text[position + 1])) {
        return scanElement();
    }
    // Everything else, document types included, is skipped up to the next ">".
    return skipBehind(">");
}

XmlScanner::Step XmlScanner::scanElement() {
    ++position;
    skipWhiteSpace();
    const std::size_t name = position;
    if (!skipName()) {
        return Step::STOP;
    }
    openNames.emplace_back(name, position - name);
    if (openNames.size() > maxDepth) {
        return refuse("elements are nested too deeply");
    }
    for (unsigned attributes = 0;; ++attributes) {
        skipWhiteSpace();
        if (atEnd()) {
            return Step::STOP;
        }
        if (startsWith("/>")) {
            position += 2;
            leaveElement();
            return Step::ON;
        }
        if (current() == '>') {
            ++position;
            return Step::ON;
        }
        if (attributes >= maxAttributes) {
            return refuse("an element has too many attributes");
        }
        if (scanAttribute() == Step::STOP) {
            return Step::STOP;
        }
    }
}

XmlScanner::Step XmlScanner::scanClosingTag() {
    const Step step = skipBehind(">");
    if (step == Step::ON && !openNames.empty()) {
        leaveElement();
    }
    return step;
}

XmlScanner::Step XmlScanner::scanDeclaration() {
    const std::size_t start = position;
    position += 5;
    while (!atEnd()) {
        if (current() == '>') {
            ++position;
            return Step::ON;
        }
        skipWhiteSpace();
        if (startsWithNoCase("version") || startsWithNoCase("encoding") ||
            startsWithNoCase("standalone")) {
            if (scanAttribute() == Step::STOP) {
                break;
            }
            continue;
        }
        while (!atEnd() && current() != '>' && !isWhiteSpace(current())) {
            ++position;
        }
    }
    // The parser ends quietly here, or with a failed assertion of its own.
    return hazard.empty() ? fail("a declaration is malformed", atEnd() ? position : start)
                          : Step::STOP;
}

XmlScanner::Step XmlScanner::scanAttribute() {
    skipWhiteSpace();
    if (!skipName()) {
        return Step::STOP;
    }
    skipWhiteSpace();
    if (atEnd() || current() != '=') {
        return Step::STOP;
    }
    ++position;
    skipWhiteSpace();
    if (atEnd()) {
        return Step::STOP;
    }
    if (current() == '"' || current() == '\'') {
        const std::string quote(1, current());
        ++position;
        if (scanText(quote) == Step::STOP || atEnd()) {
            return Step::STOP;
        }
        ++position;
        return Step::ON;
    }
    while (!atEnd() && !isWhiteSpace(current()) && current() != '/' && current() != '>') {
        if (current() == '"' || current() == '\'') {
            return Step::STOP;
        }
        ++position;
    }
    return Step::ON;
}

// The end itself is left alone.
XmlScanner::Step XmlScanner::scanText(const std::string& end) {
    while (!atEnd() && !startsWith(end)) {
        if (current() != '&') {
            ++position;
        } else if (scanReference() == Step::STOP) {
            return Step::STOP;
        }
    }
    return Step::ON;
}

// The parser drops the "&" in front of a name that it does not know.
XmlScanner::Step XmlScanner::scanReference() {
    if (startsWith("&#")) {
        return scanCharacterReference();
    }
    const bool isKnown = startsWith("&amp;") || startsWith("&lt;") || startsWith("&gt;") ||
                         startsWith("&quot;") || startsWith("&apos;");
    if (!isKnown && unknown == std::string::npos) {
        unknown = position;
    }
    ++position;
    return Step::ON;
}

// In a malformed reference the parser looks for the next ";", wherever it is, and may take markup
// on the way for a part of the reference.
XmlScanner::Step XmlScanner::scanCharacterReference() {
    const std::size_t reference = position;
    position += 2;
    const bool hexadecimal = startsWith("x");
    position += hexadecimal ? 1 : 0;
    std::uint32_t code = 0;
    const std::size_t start = position;
    for (; !atEnd() && current() != ';'; ++position) {
        const int digit = hexadecimal || isDigit(current()) ? hexValue(current()) : -1;
        if (digit < 0) {
            return fail("a character reference is malformed", reference);
        }
        if (code <= LAST_CODE_POINT) {
            code = code * (hexadecimal ? 16 : 10) + static_cast<std::uint32_t>(digit);
        }
    }
    if (atEnd()) {
        return Step::STOP;
    }
    if (position == start || !isXmlCharacter(code)) {
        return fail("a character reference names no character", reference);
    }
    ++position;
    return Step::ON;
}

XmlScanner::Step XmlScanner::skipBehind(const std::string& end) {
    const std::size_t found = text.find(end, position);
    if (found == std::string::npos) {
        position = text.size();
        return Step::STOP;
    }
    position = found + end.size();
    return Step::ON;
}

XmlScanner::Step XmlScanner::fail(const std::string& reason, std::size_t where) {
    hazard = reason;
    position = where;
    return Step::STOP;
}

XmlScanner::Step XmlScanner::refuse(const std::string& reason) {
    beyondLimits = true;
    return fail(reason, position);
}

void XmlScanner::leaveElement() {
    openNames.pop_back();
    completeEnd = position;
    completeDepth = openNames.size();
}

bool XmlScanner::startsWith(const std::string& prefix) const {
    return text.compare(position, prefix.size(), prefix) == 0;
}

bool XmlScanner::startsWithNoCase(const std::string& lowerPrefix) const {
    return isAtNoCase(text, position, lowerPrefix);
}

bool XmlScanner::skipName() {
    if (atEnd() || !isNameStart(current())) {
        return false;
    }
    while (!atEnd() && isNameCharacter(current())) {
        ++position;
    }
    return true;
}

// The parser's white space: byte order marks and the two non-characters behind them belong to it.
void XmlScanner::skipWhiteSpace() {
    while (!atEnd()) {
        if (startsWith("\xEF\xBB\xBF") || startsWith("\xEF\xBF\xBE") ||
            startsWith("\xEF\xBF\xBF")) {
            position += 3;
        } else if (isWhiteSpace(current())) {
            ++position;
        } else {
            return;
        }
    }
}

}  // namespace Util
