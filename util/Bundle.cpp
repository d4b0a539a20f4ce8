#include "util/Bundle.h"

#include <boost/make_shared.hpp>
#include <cstring>

#include "core/util/Ascii.h"
#include "pal/kd_assert.h"

namespace Util {

namespace {

const char* const ASSERT_PATH = "util/Bundle";

template <typename Payload>
std::uint32_t toScalar(Payload payload) {
    static_assert(sizeof(Payload) == sizeof(std::uint32_t), "the scalar is one 32-bit word");
    std::uint32_t scalar = 0;
    std::memcpy(&scalar, &payload, sizeof scalar);
    return scalar;
}

template <typename Payload>
Payload fromScalar(std::uint32_t scalar) {
    static_assert(sizeof(Payload) == sizeof(std::uint32_t), "the scalar is one 32-bit word");
    Payload payload;
    std::memcpy(&payload, &scalar, sizeof payload);
    return payload;
}

Bundle::Elem scalarElem(Bundle::ElemType type, std::uint32_t scalar) {
    Bundle::Elem elem;
    elem.type = type;
    elem.scalar = scalar;
    return elem;
}

/** Stands for an element that is not there when the assertion handler returns. */
const Bundle::Elem& missingElem() {
    static const Bundle::Elem missing;
    return missing;
}

}  // namespace

Bundle::~Bundle() = default;

bool Bundle::Elem::asBoolean() const {
    return scalar != 0;
}

int Bundle::Elem::asInt() const {
    return fromScalar<int>(scalar);
}

float Bundle::Elem::asFloat() const {
    return fromScalar<float>(scalar);
}

std::string Bundle::normalizeKey(const std::string& key) {
    std::string normalized;
    normalized.reserve(key.size());
    for (const char c : key) {
        if (c == '_' || c == '-' || c == ' ') {
            continue;
        }
        normalized += toLower(c);
    }
    return normalized;
}

void Bundle::put(const std::string& key, const Elem& elem) {
    rep[normalizeKey(key)] = elem;
}

void Bundle::putBoolean(const std::string& key, bool value) {
    put(key, scalarElem(BOOLEAN, value ? 1 : 0));
}

void Bundle::putInt(const std::string& key, int value) {
    put(key, scalarElem(INT, toScalar(value)));
}

void Bundle::putFloat(const std::string& key, float value) {
    put(key, scalarElem(FLOAT, toScalar(value)));
}

void Bundle::putLatLon(const std::string& key, const LatLon& value) {
    Elem elem;
    elem.type = LATLON;
    elem.latLon = value;
    put(key, elem);
}

void Bundle::putString(const std::string& key, const std::string& value) {
    Elem elem;
    elem.type = STRING;
    elem.text = value;
    put(key, elem);
}

void Bundle::putBundle(const std::string& key, const boost::shared_ptr<const Bundle>& value) {
    Elem elem;
    elem.type = BUNDLE;
    elem.bundle = value;
    put(key, elem);
}

const Bundle::Elem& Bundle::get(const std::string& key) const {
    const auto cit = rep.find(normalizeKey(key));
    if (!KOR_ASSERT_AT(cit != rep.end(), "cit != rep.end()", ASSERT_PATH, __LINE__)) {
        return missingElem();
    }
    return cit->second;
}

const Bundle::Elem& Bundle::getTyped(const std::string& key, ElemType type,
                                     const char* condition) const {
    const Elem& elem = get(key);
    // Every payload exists in every element: a caller may read on whatever the type.
    KOR_ASSERT_AT(elem.type == type, condition, ASSERT_PATH, __LINE__);
    return elem;
}

bool Bundle::getBoolean(const std::string& key) const {
    return getTyped(key, BOOLEAN, "e.type == BOOLEAN").asBoolean();
}

int Bundle::getInt(const std::string& key) const {
    return getTyped(key, INT, "e.type == INT").asInt();
}

float Bundle::getFloat(const std::string& key) const {
    return getTyped(key, FLOAT, "e.type == FLOAT").asFloat();
}

Bundle::LatLon Bundle::getLatLon(const std::string& key) const {
    return getTyped(key, LATLON, "e.type == LATLON").latLon;
}

const std::string& Bundle::getString(const std::string& key) const {
    return getTyped(key, STRING, "e.type == STRING").text;
}

boost::shared_ptr<const Bundle> Bundle::getBundle(const std::string& key) const {
    return getTyped(key, BUNDLE, "e.type == BUNDLE").bundle;
}

Bundle::ElemType Bundle::getType(const std::string& key) const {
    return get(key).type;
}

bool Bundle::hasKey(const std::string& key) const {
    return rep.count(normalizeKey(key)) > 0;
}

std::vector<std::string> Bundle::getKeys() const {
    std::vector<std::string> keys;
    for (const auto& entry : rep) {
        keys.push_back(entry.first);
    }
    return keys;
}

boost::shared_ptr<Bundle> Bundle::clone() const {
    boost::shared_ptr<Bundle> copy = boost::make_shared<Bundle>();
    for (const auto& entry : rep) {
        copy->put(entry.first, entry.second);
    }
    return copy;
}

/** Compares names as they are written in the table. */
const Bundle::ElemSpec* Bundle::findRow(const ElemSpec* spec, const std::string& key) {
    for (; spec != nullptr && spec->name != nullptr; ++spec) {
        if (key == spec->name) {
            return spec;
        }
    }
    return nullptr;
}

bool Bundle::conformsTo(const ElemSpec* spec) const {
    for (const ElemSpec* row = spec; row != nullptr && row->name != nullptr; ++row) {
        const auto found = rep.find(normalizeKey(row->name));
        if (found == rep.end() || found->second.type != row->type) {
            return false;
        }
        if (row->type == BUNDLE) {
            const boost::shared_ptr<const Bundle>& nested = found->second.bundle;
            if (!nested || !nested->conformsTo(row->subSpec)) {
                return false;
            }
        }
    }
    for (const auto& entry : rep) {
        if (findRow(spec, entry.first) == nullptr) {
            return false;
        }
    }
    return true;
}

}  // namespace Util
