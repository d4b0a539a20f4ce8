#include "core/util/XmlUtils.h"

#include <tinyxml.h>

#include <mutex>

#include "pal/kd_log.h"
#include "util/Utf8.h"
#include "util/XmlEncoding.h"
#include "util/XmlScanner.h"

namespace Util {

namespace {

/** The parser's setting is one for the process: held for the length of one parse. */
class WhiteSpaceSetting {
  public:
    explicit WhiteSpaceSetting(bool keep)
        : lock(mutex()), before(TiXmlBase::IsWhiteSpaceCondensed()) {
        TiXmlBase::SetCondenseWhiteSpace(!keep);
    }
    ~WhiteSpaceSetting() { TiXmlBase::SetCondenseWhiteSpace(before); }
    WhiteSpaceSetting(const WhiteSpaceSetting&) = delete;
    WhiteSpaceSetting& operator=(const WhiteSpaceSetting&) = delete;

  private:
    static std::mutex& mutex() {
        static auto* const made = new std::mutex;
        return *made;
    }

    const std::lock_guard<std::mutex> lock;
    const bool before;
};

const char* const TOO_LARGE = "the text is too large";
const char* const NOT_UTF8 = "the text is not UTF-8";
const char* const TEXT_OUTSIDE = "text outside of the elements";
const char* const UNKNOWN_ENTITY = "an unknown entity loses its \"&\"";

std::string parse(const std::string& xml, bool keepWhiteSpace, TiXmlDocument& document) {
    const WhiteSpaceSetting setting(keepWhiteSpace);
    document.Clear();
    const char* const rest = document.Parse(xml.c_str(), nullptr, TIXML_ENCODING_UTF8);
    if (document.Error()) {
        return document.ErrorDesc();
    }
    if (document.RootElement() == nullptr) {
        return "no element";
    }
    return rest != nullptr && *rest != '\0' ? TEXT_OUTSIDE : std::string();
}

std::string describe(const char* reason, std::size_t line, std::size_t column) {
    return std::string(reason) + " (line " + std::to_string(line) + ", column " +
           std::to_string(column) + ")";
}

/** @param position in `text`, which is UTF-8 before it */
std::string describeAt(const char* reason, const std::string& text, std::size_t position) {
    std::size_t line = 1;
    std::size_t column = 1;
    // A byte order mark is no character of the text.
    for (std::size_t i = text.compare(0, 3, "\xEF\xBB\xBF") == 0 ? 3 : 0; i < position; ++i) {
        const bool isContinuation = (static_cast<unsigned char>(text[i]) & 0xC0U) == 0x80;
        column += isContinuation ? 0 : 1;
        if (text[i] == '\n') {
            ++line;
            column = 1;
        }
    }
    return describe(reason, line, column);
}

/** Parses a text that is safe; returns where and why the parser stopped before its end. */
std::string parseUsable(const std::string& xml, TiXmlDocument& document) {
    const WhiteSpaceSetting setting(false);
    document.SetTabSize(1);
    const char* const rest = document.Parse(xml.c_str(), nullptr, TIXML_ENCODING_UTF8);
    if (document.Error()) {
        // Without a place the parser means the end.
        return document.ErrorRow() > 0
                   ? describe(document.ErrorDesc(), static_cast<std::size_t>(document.ErrorRow()),
                              static_cast<std::size_t>(document.ErrorCol()))
                   : describeAt(document.ErrorDesc(), xml, xml.size());
    }
    return rest != nullptr && *rest != '\0'
               ? describeAt(TEXT_OUTSIDE, xml, static_cast<std::size_t>(rest - xml.c_str()))
               : std::string();
}

}  // namespace

std::string XmlUtils::findHazard(const std::string& xml) {
    if (xml.size() > MAX_SIZE_BYTES) {
        return TOO_LARGE;
    }
    if (!isUtf8Text(xml)) {
        return NOT_UTF8;
    }
    return XmlScanner(xml, MAX_DEPTH, MAX_ATTRIBUTES).findHazard();
}

bool XmlUtils::load(const std::vector<unsigned char>& bytes, bool keepWhiteSpace,
                    TiXmlDocument& document) {
    std::string xml(bytes.begin(), bytes.end());
    xml.erase(xml.find_last_not_of('\0') + 1);
    std::string reason = findHazard(xml);
    if (reason.empty()) {
        reason = parse(xml, keepWhiteSpace, document);
    }
    if (!reason.empty()) {
        kdLogFormatMessage("XmlUtils: %s", reason.c_str());
    }
    return reason.empty();
}

std::string XmlUtils::loadUsable(const std::string& xml, TiXmlDocument& document) {
    document.Clear();
    if (xml.size() > MAX_SIZE_BYTES) {
        return TOO_LARGE;
    }
    const std::string text = xmlToUtf8(xml);
    const std::string valid = text.substr(0, utf8PrefixLength(text));
    XmlScanner scanner(valid, MAX_DEPTH, MAX_ATTRIBUTES);
    std::string blemish = scanner.findHazard();
    if (scanner.isBeyondLimits()) {
        return describeAt(blemish.c_str(), valid, scanner.stoppedAt());
    }
    const bool isCut = valid.size() < text.size() && scanner.stoppedAt() == valid.size();
    if (isCut) {
        blemish = NOT_UTF8;
    }
    const std::string usable = blemish.empty() ? valid : scanner.completeElements();
    if (!usable.empty() || blemish.empty()) {
        std::string error = parseUsable(usable, document);
        if (!error.empty()) {
            return error;
        }
    }
    if (!blemish.empty()) {
        return describeAt(blemish.c_str(), valid, scanner.stoppedAt());
    }
    return scanner.unknownEntity() == std::string::npos
               ? std::string()
               : describeAt(UNKNOWN_ENTITY, valid, scanner.unknownEntity());
}

}  // namespace Util
