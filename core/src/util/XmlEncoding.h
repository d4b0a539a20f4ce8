#pragma once

#include <string>

namespace Util {

/**
 * The text of an XML document in UTF-8, converted from the single-byte encoding that the document
 * declares. A document that is UTF-8 up to its end or its first zero byte comes back unchanged,
 * whatever it declares: callers that read it into a string may have converted it before.
 *
 * Converts ISO-8859-1, windows-1251 and windows-1252. Other single-byte encodings are read as
 * ISO-8859-1, with a line in the log; of these, only the characters of ASCII come out right. A
 * document that declares anything else comes back unchanged.
 */
std::string xmlToUtf8(const std::string& xml);

}  // namespace Util
