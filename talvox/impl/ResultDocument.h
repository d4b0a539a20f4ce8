/**
 * @file
 * The service's answer.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "talvox/RecognitionResult.h"

namespace Talvox {

/**
 * Reads the hypotheses out of the response header that carries them: a result document in XML,
 * coded as base64. The header comes from outside and may hold anything.
 * @return the hypotheses in the document's order, none when the service says that it recognised
 *         nothing; null when the header cannot be decoded or its text cannot be parsed
 */
boost::shared_ptr<RecognitionResults> parseResultHeader(const std::string& header);

}  // namespace Talvox
