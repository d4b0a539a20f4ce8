#include "talvox/impl/ResultDocument.h"

#include <tinyxml.h>

#include <boost/make_shared.hpp>
#include <vector>

#include "core/util/Base64Coder.h"
#include "core/util/XmlUtils.h"
#include "pal/kd.h"
#include "util/impl/NumberText.h"

namespace Talvox {

namespace {

/** 0 where there is no number. */
float readConfidence(const TiXmlElement& variant) {
    const char* const text = variant.Attribute("confidence");
    return text == nullptr ? 0.0F : Util::NumberText::readFloat(text).value;
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
