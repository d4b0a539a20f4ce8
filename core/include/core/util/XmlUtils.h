/**
 * @file
 * Guarded XML parsing.
 */
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "core/Export.h"

class TiXmlDocument;

namespace Util {

/**
 * Parses XML from sources that are not trusted with TinyXML, which by itself reads past its buffer
 * on truncated UTF-8 and overflows the stack on deep nesting. Stateless; any thread.
 */
class KORVEL_CORE_API XmlUtils {
  public:
    /** Largest accepted text in bytes (1 MiB). */
    static constexpr std::size_t MAX_SIZE_BYTES = std::size_t{1024} * 1024;
    /** Deepest accepted nesting of elements. */
    static constexpr unsigned MAX_DEPTH = 64;
    /** Most accepted attributes of one element; the parser needs quadratic time for them. */
    static constexpr unsigned MAX_ATTRIBUTES = 256;

    /**
     * Tells what in `xml` must not be handed to the parser: a text beyond `MAX_SIZE_BYTES`, bytes
     * that are not UTF-8 (an embedded zero byte counts), nesting beyond `MAX_DEPTH`, more than
     * `MAX_ATTRIBUTES` attributes, numeric character references that are malformed or name no
     * character, a malformed declaration. Other errors are left to the parser, so that what
     * stands before them can be used.
     * @return an empty text when the parser may have it, else the reason in plain words
     */
    static std::string findHazard(const std::string& xml);

    /**
     * Checks and parses a text. Zero bytes at its end are not part of it.
     * @param bytes          the text
     * @param keepWhiteSpace keep runs of white space in texts as they stand; otherwise they are
     *                       condensed to one blank
     * @param[out] document  the parsed document; what it holds after a failure is not specified
     * @return true when the whole text was parsed without an error and has an element; otherwise a
     *         line with the reason was logged
     */
    static bool load(const std::vector<unsigned char>& bytes, bool keepWhiteSpace,
                     TiXmlDocument& document);

    /**
     * Parses as much of a text as can be used, for a reader to whom a part is better than nothing;
     * `load` is for one to whom it is not. Runs of white space are condensed.
     *
     * - A text beyond the three limits leaves the document empty.
     * - At the first byte that is not UTF-8, zero byte, bad numeric character reference or bad
     *   declaration the text ends: the document holds the elements that were complete before, and
     *   the open ones around them.
     * - After any other syntax error the document holds what the parser had read, the element that
     *   it was reading included.
     * - A reference to an unknown entity ends nothing, but the parser drops its "&".
     *
     * A text that is not UTF-8 and declares a single-byte encoding is converted first:
     * ISO-8859-1, windows-1251 and windows-1252 by their tables, others as ISO-8859-1, with a line
     * in the log. Nothing else is logged.
     * @param[out] document  what could be used
     * @return an empty text when the whole text was parsed without an error; else what is wrong and
     *         where, as in "the text is not UTF-8 (line 3, column 12)"
     */
    static std::string loadUsable(const std::string& xml, TiXmlDocument& document);
};

}  // namespace Util
