#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

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

    /** The hazard is one of the limits, not a blemish: no part of the text should be used. */
    bool isBeyondLimits() const { return beyondLimits; }

    /** Where the hazard stands or, without one, where the walk ended. */
    std::size_t stoppedAt() const { return position; }

    /** Where the first reference stands whose entity the parser does not know; else `npos`. */
    std::size_t unknownEntity() const { return unknown; }

    /**
     * The text up to the end of the last complete element before that place, with end tags added
     * for the elements that are open there. Empty when there is no complete element.
     */
    std::string completeElements() const;

  private:
    enum class Step { ON, STOP };

    Step scanMarkup();
    Step scanElement();
    Step scanClosingTag();
    Step scanDeclaration();
    Step scanAttribute();
    Step scanText(const std::string& end);
    Step scanReference();
    Step scanCharacterReference();
    Step skipBehind(const std::string& end);
    Step fail(const std::string& reason, std::size_t where);
    Step refuse(const std::string& reason);
    void leaveElement();

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
    /** Of the open elements, outermost first: where the name begins, and its length. */
    std::vector<std::pair<std::size_t, std::size_t>> openNames;
    /** Behind the last complete element, and how many elements are open there. */
    std::size_t completeEnd = 0;
    std::size_t completeDepth = 0;
    std::size_t unknown = std::string::npos;
    bool beyondLimits = false;
    std::string hazard;
};

}  // namespace Util
