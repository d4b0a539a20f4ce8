#pragma once

#include <cstddef>
#include <string>

namespace Util {

/**
 * Walks over the markup of a text in the way TinyXML does, without recursion, and finds what the
 * parser must not see. Where the parser would give up with an error, the walk ends as well: what
 * follows is never parsed.
 */
class XmlScanner {
  public:
    /** @param text valid UTF-8 without zero bytes, to be kept while the scanner lives */
    XmlScanner(const std::string& text, unsigned maxDepth, unsigned maxAttributes);

    /** @return an empty text when nothing is found, else the reason in plain words */
    std::string findHazard();

  private:
    enum class Step { ON, STOP };

    Step scanMarkup();
    Step scanElement();
    Step scanClosingTag();
    Step scanDeclaration();
    Step scanAttribute();
    Step scanText(const std::string& end);
    Step scanReference();
    Step skipBehind(const std::string& end);
    Step fail(const std::string& reason);

    bool atEnd() const { return position >= text.size(); }
    char current() const { return text[position]; }
    bool startsWith(const std::string& prefix) const;
    bool startsWithNoCase(const std::string& lowerPrefix) const;
    bool skipName();
    void skipWhiteSpace();

    const std::string& text;
    const unsigned maxDepth;
    const unsigned maxAttributes;
    std::size_t position = 0;
    unsigned depth = 0;
    std::string hazard;
};

}  // namespace Util
