#include <boost/make_shared.hpp>
#include <vector>

#include "core/util/Ascii.h"
#include "core/util/XmlUtils.h"
#include "pal/kd_log.h"
#include "tinyxml.h"
#include "util/Bundle.h"
#include "util/impl/NumberText.h"

namespace Util {

namespace {

const char* const UPDATE_FROM_XML = "updateFromXml";
const char* const TO_XML_STRING = "toXmlString";
const char* const BLANKS = " \t\n\v\f\r";

std::vector<std::string> splitPath(const std::string& path) {
    std::vector<std::string> pieces;
    for (std::size_t start = path.find_first_not_of('/'); start != std::string::npos;) {
        const std::size_t end = path.find('/', start);
        pieces.push_back(path.substr(start, end - start));
        start = path.find_first_not_of('/', end);
    }
    return pieces;
}

/** The node that the path leads to, or null. */
const TiXmlNode* findNode(const TiXmlNode& start, const std::string& path) {
    const TiXmlNode* node = &start;
    for (const std::string& piece : splitPath(path)) {
        node = node->FirstChildElement(piece.c_str());
        if (node == nullptr) {
            return nullptr;
        }
    }
    return node;
}

std::string bodyOf(const TiXmlElement& element) {
    const TiXmlNode* child = element.FirstChild();
    if (child == nullptr) {
        kdLogFormatMessage("%s: no body", element.Value());
        return std::string();
    }
    return child->Value();
}

bool readBoolean(const std::string& key, const std::string& text) {
    const std::string lower = toLower(text);
    if (lower.empty() || lower == "0" || lower == "false" || lower == "no") {
        return false;
    }
    if (lower != "1" && lower != "true" && lower != "yes" && lower != "on") {
        kdLogFormatMessage("%s: value of %s not a boolean: %.64s, taking true", UPDATE_FROM_XML,
                           key.c_str(), text.c_str());
    }
    return true;
}

/** Takes the number; logs a line when it is not all that the text says. */
template <typename Number>
Number accept(const NumberText::Reading<Number>& reading, const std::string& key,
              const std::string& text) {
    if (reading.status == NumberText::OUT_OF_RANGE) {
        kdLogFormatMessage("%s: value of %s out of range: %.64s, taking the nearest",
                           UPDATE_FROM_XML, key.c_str(), text.c_str());
    } else if (text.find_first_not_of(BLANKS, reading.end) != std::string::npos) {
        kdLogFormatMessage("%s: value of %s not only a number: %.64s, ignoring what follows it",
                           UPDATE_FROM_XML, key.c_str(), text.c_str());
    }
    return reading.value;
}

/** The value of a text, or the old one when the text is not a number. */
template <typename Number>
Number acceptOrKeep(const NumberText::Reading<Number>& reading, const std::string& key,
                    const std::string& text, Number old) {
    if (reading.status != NumberText::NOT_A_NUMBER) {
        return accept(reading, key, text);
    }
    kdLogFormatMessage("%s: value of %s not a number: %.64s, keeping the old value",
                       UPDATE_FROM_XML, key.c_str(), text.c_str());
    return old;
}

/** A part that is not a number counts as 0, and so does the part behind it. */
Bundle::LatLon readLatLon(const std::string& key, const std::string& text) {
    Bundle::LatLon latLon;
    const NumberText::Reading<float> lat = NumberText::readFloat(text);
    NumberText::Reading<float> lon;
    if (lat.status != NumberText::NOT_A_NUMBER) {
        latLon.lat = lat.value;
        if (lat.end < text.size() && text[lat.end] == ',') {
            lon = NumberText::readFloat(text, lat.end + 1);
        }
    }
    if (lon.status == NumberText::NOT_A_NUMBER) {
        kdLogFormatMessage("%s: value of %s not a position: %.64s, taking 0 for what is missing",
                           UPDATE_FROM_XML, key.c_str(), text.c_str());
        return latLon;
    }
    if (lat.status == NumberText::OUT_OF_RANGE) {
        lon.status = NumberText::OUT_OF_RANGE;
    }
    latLon.lon = accept(lon, key, text);
    return latLon;
}

/** The text of a scalar element; false for a type that has none. */
bool writeScalar(const Bundle::Elem& elem, std::string& text) {
    switch (elem.type) {
        case Bundle::BOOLEAN:
            text = elem.asBoolean() ? "true" : "false";
            return true;
        case Bundle::INT:
            text = std::to_string(elem.asInt());
            return true;
        case Bundle::FLOAT:
            text = NumberText::writeFloat(elem.asFloat());
            return true;
        case Bundle::LATLON:
            text = NumberText::writeFloat(elem.latLon.lat) + "," +
                   NumberText::writeFloat(elem.latLon.lon);
            return true;
        case Bundle::STRING:
            text = elem.text;
            return true;
        default:
            return false;
    }
}

}  // namespace

std::string Bundle::toXmlString(const std::string& name) const {
    std::string xml = "<" + name + ">\n";
    for (const auto& [key, elem] : rep) {
        std::string text;
        if (elem.type == BUNDLE) {
            xml += elem.bundle ? elem.bundle->toXmlString(key) : Bundle().toXmlString(key);
        } else if (writeScalar(elem, text)) {
            xml.append("<").append(key).append(">").append(text);
            xml.append("</").append(key).append(">\n");
        } else {
            kdLogFormatMessage("%s: unknown element type for %s: %d; ignoring", TO_XML_STRING,
                               key.c_str(), elem.type);
        }
    }
    return xml + "</" + name + ">\n";
}

void Bundle::updateFromXml(const std::string& xml, const std::string& path, const ElemSpec* spec) {
    TiXmlDocument document;
    const std::string fault = XmlUtils::loadUsable(xml, document);
    if (!fault.empty()) {
        kdLogFormatMessage("Bundle::updateFromXml parse error: %s", fault.c_str());
    }
    updateFromXml(document, path, spec);
}

std::string Bundle::updateFromWholeXml(const std::string& xml, const std::string& path,
                                       const ElemSpec* spec) {
    TiXmlDocument document;
    std::string fault = XmlUtils::loadUsable(xml, document);
    if (fault.empty() && findNode(document, path) == nullptr) {
        fault = "there is no element " + path;
    }
    if (fault.empty()) {
        updateFromXml(document, path, spec);
    }
    return fault;
}

void Bundle::updateFromXml(const TiXmlNode& node, const std::string& path, const ElemSpec* spec) {
    const TiXmlNode* parent = findNode(node, path);
    if (parent == nullptr) {
        kdLogFormatMessage("%s: path %s does not exist", UPDATE_FROM_XML, path.c_str());
        return;
    }
    for (const TiXmlElement* element = parent->FirstChildElement(); element != nullptr;
         element = element->NextSiblingElement()) {
        updateElement(*element, spec);
    }
}

void Bundle::updateElement(const TiXmlElement& element, const ElemSpec* spec) {
    const std::string text = bodyOf(element);
    const std::string key = normalizeKey(element.Value());
    const ElemSpec* row = findRow(spec, key);
    if (row == nullptr) {
        kdLogFormatMessage("%s: unknown element name %s, ignoring", UPDATE_FROM_XML, key.c_str());
        return;
    }
    const Elem none;
    const auto found = rep.find(key);
    const Elem& old = found != rep.end() && found->second.type == row->type ? found->second : none;
    switch (row->type) {
        case BOOLEAN:
            putBoolean(key, readBoolean(key, text));
            break;
        case INT:
            putInt(key, acceptOrKeep(NumberText::readInt(text), key, text, old.asInt()));
            break;
        case FLOAT:
            putFloat(key, acceptOrKeep(NumberText::readFloat(text), key, text, old.asFloat()));
            break;
        case LATLON:
            putLatLon(key, readLatLon(key, text));
            break;
        case STRING:
            putString(key, text);
            break;
        case BUNDLE:
            updateSubBundle(element, key, row->subSpec);
            break;
        default:
            kdLogFormatMessage("%s: unknown element type for %s: %d; ignoring", UPDATE_FROM_XML,
                               key.c_str(), row->type);
    }
}

void Bundle::updateSubBundle(const TiXmlElement& element, const std::string& key,
                             const ElemSpec* subSpec) {
    boost::shared_ptr<Bundle> updated;
    const auto old = rep.find(key);
    if (old == rep.end()) {
        updated = boost::make_shared<Bundle>();
    } else if (old->second.type != BUNDLE) {
        kdLogFormatMessage("%s: old value of %s not a bundle, ignoring update", UPDATE_FROM_XML,
                           key.c_str());
        return;
    } else {
        updated = old->second.bundle ? old->second.bundle->clone() : boost::make_shared<Bundle>();
    }
    updated->updateFromXml(element, "", subSpec);
    putBundle(key, updated);
}

}  // namespace Util
