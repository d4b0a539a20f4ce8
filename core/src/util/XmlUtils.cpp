#include "core/util/XmlUtils.h"

#include <tinyxml.h>

#include <mutex>

#include "pal/kd_log.h"
#include "util/Utf8.h"
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
    return rest != nullptr && *rest != '\0' ? "text outside of the elements" : std::string();
}

}  // namespace

std::string XmlUtils::findHazard(const std::string& xml) {
    if (xml.size() > MAX_SIZE_BYTES) {
        return "the text is too large";
    }
    if (!isUtf8Text(xml)) {
        return "the text is not UTF-8";
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

}  // namespace Util
