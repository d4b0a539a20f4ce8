/* A program of operations on a few bundles, run on the bundles and on a plain model of them. */
#include "util/Bundle.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cfloat>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Fuzz.h"
#include "support/AssertCapture.h"

namespace {

using Fuzz::Input;
using Fuzz::require;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using Util::Bundle;
using ElemType = Bundle::ElemType;
using ElemSpec = Bundle::ElemSpec;

constexpr std::size_t POOL_SIZE = 3;
constexpr int OPERATIONS_MAX = 200;
constexpr std::size_t NODES_MAX = 400;
constexpr std::size_t DEPTH_MAX = 24;
constexpr auto NO_TYPE = static_cast<ElemType>(9);

const ElemSpec INNER[] = {{"on", Bundle::BOOLEAN, nullptr},
                          {"deep", Bundle::BUNDLE, INNER},
                          {nullptr, Bundle::BOOLEAN, nullptr}};
const ElemSpec OUTER[] = {{"flag", Bundle::BOOLEAN, nullptr}, {"count", Bundle::INT, nullptr},
                          {"share", Bundle::FLOAT, nullptr},  {"where", Bundle::LATLON, nullptr},
                          {"name", Bundle::STRING, nullptr},  {"inner", Bundle::BUNDLE, INNER},
                          {"odd", NO_TYPE, nullptr},          {nullptr, Bundle::BOOLEAN, nullptr}};
const ElemSpec FLAGS[] = {{"flag", Bundle::BOOLEAN, nullptr}, {nullptr, Bundle::BOOLEAN, nullptr}};
const ElemSpec* const TABLES[] = {OUTER, INNER, FLAGS, nullptr};

const char* const KEYS[] = {"flag", "Fl_ag", "count", "COUNT",  "share", "s-h are", "where",
                            "name", "Name",  "inner", "IN ner", "odd",   "on",      "deep"};

/** What a bundle is supposed to hold. */
struct Model {
    struct Elem {
        ElemType type = Bundle::BOOLEAN;
        uint32_t scalar = 0;
        float lat = 0;
        float lon = 0;
        std::string text;
        std::shared_ptr<const Model> nested;
    };
    std::map<std::string, Elem> elems;
};

/** A bundle and its model. */
struct Pair {
    boost::shared_ptr<Bundle> bundle = boost::make_shared<Bundle>();
    Model model;
};

std::string normalize(const std::string& key) {
    std::string text;
    for (const char c : key) {
        if (std::strchr("_- ", c) == nullptr || c == '\0') {
            text += c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c;
        }
    }
    return text;
}

std::size_t countNodes(const Model& model) {
    std::size_t count = 1;
    for (const auto& entry : model.elems) {
        count += entry.second.nested ? countNodes(*entry.second.nested) : 1;
    }
    return count;
}

std::size_t depthOf(const Model& model) {
    std::size_t depth = 0;
    for (const auto& entry : model.elems) {
        depth = std::max(depth, entry.second.nested ? depthOf(*entry.second.nested) : 0);
    }
    return depth + 1;
}

float toFloat(uint32_t bits) {
    float value = 0;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

uint32_t toBits(float value) {
    uint32_t bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

std::string formatFloat(float value) {
    char text[64];
    std::snprintf(text, sizeof text, "%g", static_cast<double>(value));
    return text;
}

std::string writeModel(const Model& model, const std::string& name) {
    std::string xml = "<" + name + ">\n";
    for (const auto& [key, elem] : model.elems) {
        std::string text;
        switch (elem.type) {
            case Bundle::BOOLEAN:
                text = elem.scalar != 0 ? "true" : "false";
                break;
            case Bundle::INT:
                text = std::to_string(static_cast<int32_t>(elem.scalar));
                break;
            case Bundle::FLOAT:
                text = formatFloat(toFloat(elem.scalar));
                break;
            case Bundle::LATLON:
                text = formatFloat(elem.lat) + "," + formatFloat(elem.lon);
                break;
            case Bundle::STRING:
                text = elem.text;
                break;
            case Bundle::BUNDLE:
                xml += writeModel(elem.nested ? *elem.nested : Model(), key);
                continue;
            default:
                continue;
        }
        xml.append("<").append(key).append(">").append(text).append("</").append(key);
        xml.append(">\n");
    }
    return xml + "</" + name + ">\n";
}

bool modelConforms(const Model& model, const ElemSpec* table) {
    std::size_t rows = 0;
    for (const ElemSpec* row = table; row != nullptr && row->name != nullptr; ++row, ++rows) {
        const auto found = model.elems.find(row->name);
        if (found == model.elems.end() || found->second.type != row->type) {
            return false;
        }
        if (row->type == Bundle::BUNDLE &&
            (!found->second.nested || !modelConforms(*found->second.nested, row->subSpec))) {
            return false;
        }
    }
    // The names of a table differ, so another key makes the bundle the larger of the two.
    return model.elems.size() == rows;
}

void requireSame(const Bundle& bundle, const Model& model) {
    const std::vector<std::string> keys = bundle.getKeys();
    require(keys.size() == model.elems.size(), "a bundle has the model's keys");
    auto expected = model.elems.begin();
    for (const std::string& key : keys) {
        const Model::Elem& wanted = expected->second;
        require(key == expected->first, "keys are normalised and in their order");
        const Bundle::Elem& elem = bundle.get(key);
        require(elem.type == wanted.type && elem.scalar == wanted.scalar &&
                    elem.text == wanted.text && toBits(elem.latLon.lat) == toBits(wanted.lat) &&
                    toBits(elem.latLon.lon) == toBits(wanted.lon),
                "an element is the model's");
        require(static_cast<bool>(elem.bundle) == static_cast<bool>(wanted.nested),
                "a sub-bundle is there as in the model");
        if (elem.bundle) {
            requireSame(*elem.bundle, *wanted.nested);
        }
        ++expected;
    }
}

std::string takeKey(Input& input) {
    const std::size_t choice = input.takeBelow(16);
    return choice < std::size(KEYS) ? KEYS[choice] : input.takeText();
}

/** Characters that mean nothing to an XML parser and cannot spell infinity or not-a-number. */
std::string takePlainText(Input& input) {
    static const std::string alphabet = "0123456789+-.eExXabcdfpP,TRUEfalsyo";
    std::string text = input.takeText();
    for (char& c : text) {
        c = alphabet[static_cast<unsigned char>(c) % alphabet.size()];
    }
    return text;
}

/** The float nearest to a number that C's reader has made of a text. */
float clampFloat(float value) {
    return std::max(-FLT_MAX, std::min(FLT_MAX, value));
}

/** The elements that an update makes of plain text; none where the row has no text form. */
std::vector<Model::Elem> readText(ElemType type, const std::string& text, const Model::Elem& old) {
    Model::Elem elem;
    elem.type = type;
    const uint32_t kept = old.type == type ? old.scalar : 0;
    const char* const begin = text.c_str();
    char* end = nullptr;
    switch (type) {
        case Bundle::BOOLEAN: {
            std::string lower = text;
            std::transform(lower.begin(), lower.end(), lower.begin(),
                           [](char c) { return c >= 'A' && c <= 'Z' ? char(c + 32) : c; });
            elem.scalar = !lower.empty() && lower != "0" && lower != "false" && lower != "no";
            break;
        }
        case Bundle::INT: {
            const long long value = std::strtoll(begin, &end, 0);
            elem.scalar = static_cast<uint32_t>(std::clamp<long long>(value, INT32_MIN, INT32_MAX));
            elem.scalar = end == begin ? kept : elem.scalar;
            break;
        }
        case Bundle::FLOAT:
            elem.scalar = toBits(clampFloat(std::strtof(begin, &end)));
            elem.scalar = end == begin ? kept : elem.scalar;
            break;
        case Bundle::LATLON:
            elem.lat = clampFloat(std::strtof(begin, &end));
            if (end != begin && *end == ',') {
                elem.lon = clampFloat(std::strtof(end + 1, nullptr));
            }
            break;
        case Bundle::STRING:
            elem.text = text;
            break;
        default:
            return {};
    }
    return {elem};
}

/** Writes a random element of an update, and does to the model what the update should do. */
void makeUpdate(Input& input, const ElemSpec* table, Model& model, std::string& xml,
                std::size_t depth) {
    const std::string name = KEYS[input.takeBelow(std::size(KEYS))];
    // In a document a name has no blanks, though a key may.
    std::string tag = name;
    tag.erase(std::remove(tag.begin(), tag.end(), ' '), tag.end());
    const std::string key = normalize(name);
    const ElemSpec* row = table;
    while (row != nullptr && row->name != nullptr && key != row->name) {
        ++row;
    }
    const bool isKnown = row != nullptr && row->name != nullptr;
    xml += "<" + tag + ">";
    if (isKnown && row->type == Bundle::BUNDLE) {
        const auto old = model.elems.find(key);
        const bool isBlocked = old != model.elems.end() && old->second.type != Bundle::BUNDLE;
        Model updated;
        if (!isBlocked && old != model.elems.end() && old->second.nested) {
            updated = *old->second.nested;
        }
        for (std::size_t left = input.takeBelow(3); left > 0 && depth < DEPTH_MAX; --left) {
            makeUpdate(input, row->subSpec, updated, xml, depth + 1);
        }
        if (!isBlocked) {
            Model::Elem elem;
            elem.type = Bundle::BUNDLE;
            elem.nested = std::make_shared<Model>(updated);
            model.elems[key] = elem;
        }
    } else {
        const std::string text = takePlainText(input);
        xml += text;
        if (isKnown) {
            const auto found = model.elems.find(key);
            const Model::Elem old = found == model.elems.end() ? Model::Elem() : found->second;
            for (const Model::Elem& elem : readText(row->type, text, old)) {
                model.elems[key] = elem;
            }
        }
    }
    xml += "</" + tag + ">";
}

void update(Input& input, Pair& pair) {
    const ElemSpec* const table = TABLES[input.takeBelow(std::size(TABLES))];
    Model model = pair.model;
    std::string xml = "<a><b>";
    for (std::size_t left = input.takeBelow(6); left > 0; --left) {
        makeUpdate(input, table, model, xml, 0);
    }
    xml += "</b></a>";
    if (countNodes(model) > NODES_MAX || depthOf(model) > DEPTH_MAX) {
        return;
    }
    pair.bundle->updateFromXml(xml, "/a//b/", table);
    pair.model = model;
}

/** What reading a key as a type has to report. */
std::vector<std::string> expectedReports(const Model& model, const std::string& key,
                                         ElemType type) {
    static const char* const WRONG[] = {"e.type == BOOLEAN", "e.type == INT",
                                        "e.type == FLOAT",   "e.type == LATLON",
                                        "e.type == STRING",  "e.type == BUNDLE"};
    std::vector<std::string> reports;
    const auto found = model.elems.find(normalize(key));
    if (found == model.elems.end()) {
        reports.emplace_back("cit != rep.end()");
    }
    // What stands for a missing element is a boolean.
    if ((found == model.elems.end() ? Bundle::BOOLEAN : found->second.type) != type) {
        reports.emplace_back(WRONG[type]);
    }
    return reports;
}

/** Reads a key as one of the types; the value counts only where nothing was reported. */
void read(Input& input, const Pair& pair) {
    const std::string key = takeKey(input);
    const auto type = static_cast<ElemType>(input.takeBelow(6));
    const auto found = pair.model.elems.find(normalize(key));
    const Model::Elem wanted = found != pair.model.elems.end() ? found->second : Model::Elem();
    const AssertCapture asserts;
    bool isSame = false;
    switch (type) {
        case Bundle::BOOLEAN:
            isSame = pair.bundle->getBoolean(key) == (wanted.scalar != 0);
            break;
        case Bundle::INT:
            isSame = pair.bundle->getInt(key) == static_cast<int32_t>(wanted.scalar);
            break;
        case Bundle::FLOAT:
            isSame = toBits(pair.bundle->getFloat(key)) == wanted.scalar;
            break;
        case Bundle::LATLON: {
            const Bundle::LatLon position = pair.bundle->getLatLon(key);
            isSame = toBits(position.lat) == toBits(wanted.lat) &&
                     toBits(position.lon) == toBits(wanted.lon);
            break;
        }
        case Bundle::STRING:
            isSame = pair.bundle->getString(key) == wanted.text;
            break;
        default:
            isSame =
                static_cast<bool>(pair.bundle->getBundle(key)) == static_cast<bool>(wanted.nested);
    }
    std::vector<std::string> reports;
    for (const AssertReport& report : asserts.reports()) {
        require(report.path == "util/Bundle", "reports name their source");
        reports.push_back(report.condition);
    }
    require(reports == expectedReports(pair.model, key, type), "wrong reading is reported");
    require(isSame || !reports.empty(), "a reader gets the model's value");
}

void putScalar(Input& input, Pair& pair) {
    const std::string key = takeKey(input);
    Model::Elem elem;
    elem.type = static_cast<ElemType>(input.takeBelow(3));
    const uint32_t word = input.takeWord();
    if (elem.type == Bundle::BOOLEAN) {
        elem.scalar = word & 1U;
        pair.bundle->putBoolean(key, elem.scalar != 0);
    } else if (elem.type == Bundle::INT) {
        elem.scalar = word;
        pair.bundle->putInt(key, static_cast<int32_t>(word));
    } else {
        // The copies of a not-a-number on the way may quieten it.
        elem.scalar = std::isnan(toFloat(word)) ? toBits(NAN) : word;
        pair.bundle->putFloat(key, toFloat(elem.scalar));
    }
    pair.model.elems[normalize(key)] = elem;
}

void putValue(Input& input, Pair& pair) {
    const std::string key = takeKey(input);
    Model::Elem elem;
    if ((input.takeByte() & 1U) != 0) {
        elem.type = Bundle::STRING;
        elem.text = input.takeText();
        pair.bundle->putString(key, elem.text);
    } else {
        elem.type = Bundle::LATLON;
        elem.lat = static_cast<float>(static_cast<int32_t>(input.takeWord())) / 1000;
        elem.lon = static_cast<float>(static_cast<int32_t>(input.takeWord())) * 1e20F;
        pair.bundle->putLatLon(key, {elem.lat, elem.lon});
    }
    pair.model.elems[normalize(key)] = elem;
}

/** Stores an element with all of its payloads, whatever its type says. */
void putRaw(Input& input, Pair& pair) {
    const std::string key = takeKey(input);
    Model::Elem elem;
    elem.type = static_cast<ElemType>(static_cast<int>(input.takeBelow(12)) - 3);
    elem.scalar = input.takeWord();
    elem.text = input.takeText();
    Bundle::Elem raw;
    raw.type = elem.type;
    raw.scalar = elem.scalar;
    raw.text = elem.text;
    pair.bundle->put(key, raw);
    pair.model.elems[normalize(key)] = elem;
}

/** Stores a copy of a bundle in a bundle: what others share must not be changed any more. */
void nest(Input& input, Pair& outer, const Pair& inner) {
    const std::string key = takeKey(input);
    if (countNodes(outer.model) + countNodes(inner.model) > NODES_MAX ||
        depthOf(inner.model) + 1 > DEPTH_MAX) {
        return;
    }
    Model::Elem elem;
    elem.type = Bundle::BUNDLE;
    elem.nested = std::make_shared<Model>(inner.model);
    const boost::shared_ptr<const Bundle> copy = inner.bundle->clone();
    outer.bundle->putBundle(key, copy);
    outer.model.elems[normalize(key)] = elem;
    require(outer.bundle->getBundle(key) == copy, "a sub-bundle is shared");
}

void examine(Input& input, const Pair& pair) {
    const std::string key = takeKey(input);
    const bool isThere = pair.model.elems.count(normalize(key)) == 1;
    require(pair.bundle->hasKey(key) == isThere, "a key is there as in the model");
    require(!isThere || pair.bundle->getType(key) == pair.model.elems.at(normalize(key)).type,
            "a key has the model's type");
    const ElemSpec* const table = TABLES[input.takeBelow(std::size(TABLES))];
    require(pair.bundle->conformsTo(table) == modelConforms(pair.model, table),
            "a bundle conforms as its model does");
    require(pair.bundle->toXmlString("x") == writeModel(pair.model, "x"),
            "the written form is the model's");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Input input(data, size);
    Pair pool[POOL_SIZE];
    for (int i = 0; i < OPERATIONS_MAX && !input.isEmpty(); ++i) {
        Pair& pair = pool[input.takeBelow(POOL_SIZE)];
        Pair& other = pool[input.takeBelow(POOL_SIZE)];
        switch (input.takeBelow(8)) {
            case 0:
                putScalar(input, pair);
                break;
            case 1:
                putValue(input, pair);
                break;
            case 2:
                putRaw(input, pair);
                break;
            case 3:
                nest(input, pair, other);
                break;
            case 4:
                read(input, pair);
                break;
            case 5:
                update(input, pair);
                break;
            case 6:
                examine(input, pair);
                break;
            default:
                other.bundle = pair.bundle->clone();
                other.model = Model(pair.model);
        }
    }
    for (const Pair& pair : pool) {
        requireSame(*pair.bundle, pair.model);
    }
    return 0;
}
