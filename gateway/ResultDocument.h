#pragma once

#include <string>
#include <vector>

#include "gateway/Hypothesis.h"

namespace Gateway {

/**
 * The XML text that the client finds in the results header: the hypotheses in the given order, or
 * a document with success 0 where there are none.
 */
std::string makeResultDocument(const std::vector<Hypothesis>& hypotheses);

/** Text as it may stand in XML: markup escaped, control characters replaced by blanks. */
std::string escapeXml(const std::string& text);

}  // namespace Gateway
