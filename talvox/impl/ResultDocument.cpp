#include "talvox/impl/ResultDocument.h"

#include <tinyxml.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <limits>
#include <locale>
#include <sstream>
#include <vector>

#include "core/util/Base64Coder.h"
#include "core/util/XmlUtils.h"
#include "pal/kd.h"

namespace Talvox {

namespace {

/** The attribute as a number, with a point whatever the process's locale; 0 without a number. */
float readConfidence(const TiXmlElement& variant) {
    const char* const text = variant.Attribute("confidence");
    if (text == nullptr) {
        return 0.0F;
    }
    std::istringstream stream(text);
    stream.imbue(std::locale::classic());
    double confidence = 0.0;
    stream >> confidence;
    const double limit = std::numeric_limits<float>::max();
    return static_cast<float>(std::max(-limit, std::min(limit, confidence)));
}

void readVariants(const TiXmlElement& root, RecognitionResults& results) {
    for (const TiXmlElement* variant = root.FirstChildElement("variant"); variant != nullptr;
         variant = variant->NextSiblingElement()) {
        const char* const text = variant->GetText();
        if (text == nullptr) {
            kdLogFormatMessage(
                "RecognizeRequest::onResponseReceived: warning: empty string in "
                "recognitionResults");
            continue;
        }
        results.emplace_back(text, readConfidence(*variant));
    }
}

}  // namespace

boost::shared_ptr<RecognitionResults> parseResultHeader(const std::string& header) {
    std::vector<unsigned char> bytes;
    if (!Util::Base64Coder::decode(header, bytes)) {
        kdLogFormatMessage("RecognizeRequest::onResponseReceived: results are not base64");
        return nullptr;
    }
    bytes.push_back(0);
    kdLogFormatMessage("RecognizeRequest::onResponseReceived: decoded response: %s",
                       reinterpret_cast<const char*>(bytes.data()));
    TiXmlDocument document;
    if (!Util::XmlUtils::load(bytes, false, document)) {
        return nullptr;
    }
    auto results = boost::make_shared<RecognitionResults>();
    const TiXmlElement* const root = document.FirstChildElement("recognitionResults");
    int success = 0;
    if (root != nullptr) {
        root->Attribute("success", &success);
    }
    if (success != 0) {
        readVariants(*root, *results);
    }
    return results;
}

}  // namespace Talvox
