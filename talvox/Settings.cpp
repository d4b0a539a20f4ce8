#include "talvox/Settings.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <iterator>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "talvox/SettingsTable.h"
#include "talvox/impl/SettingsCheck.h"

namespace Talvox {

namespace {

/** What is stored under a key that has a rule. */
struct Value {
    std::string text;
    double number = 0; /**< of an integer or a float */
};

Value readValue(const Settings& settings, const SettingRow& row) {
    Value value;
    if (row.type == Util::Bundle::STRING) {
        value.text = settings.getString(row.key);
    } else if (row.type == Util::Bundle::INT) {
        value.number = settings.getInt(row.key);
    } else if (row.type == Util::Bundle::FLOAT) {
        value.number = static_cast<double>(settings.getFloat(row.key));
    }
    return value;
}

void writeNumber(Settings& settings, const SettingRow& row, double number) {
    if (row.type == Util::Bundle::INT) {
        settings.putInt(row.key, static_cast<int>(number));
    } else {
        settings.putFloat(row.key, static_cast<float>(number));
    }
}

void writeDefault(Settings& settings, const SettingRow& row) {
    switch (row.type) {
        case Util::Bundle::BOOLEAN:
            settings.putBoolean(row.key, row.numberDefault != 0);
            break;
        case Util::Bundle::STRING:
            settings.putString(row.key, *row.textDefault);
            break;
        case Util::Bundle::LATLON:
            settings.putLatLon(row.key, Util::Bundle::LatLon());
            break;
        default:
            writeNumber(settings, row, row.numberDefault);
    }
}

bool isOneOf(const std::string& text, const SettingRule& rule) {
    return std::any_of(
        std::begin(rule.values), std::end(rule.values),
        [&text](const std::string* value) { return value != nullptr && text == *value; });
}

/** Written so that a number that is none is out of range. */
bool isInRange(const Settings& settings, double number, const SettingRule& rule) {
    return number >= rule.lowest && number <= rule.highest &&
           (!rule.isUpToUpperConfidence ||
            number <= static_cast<double>(settings.getFloat(Settings::SKS_UPPER_CONFIDENCE)));
}

bool isGood(const Settings& settings, const SettingRule& rule, const Value& value) {
    switch (rule.kind) {
        case SettingRule::ANY:
            return true;
        case SettingRule::NOT_EMPTY:
            return !value.text.empty();
        case SettingRule::UUID_LENGTH:
            return value.text.size() == SettingsTable::UUID_BYTES;
        case SettingRule::ONE_OF:
            return isOneOf(value.text, rule);
        case SettingRule::RANGE:
            return isInRange(settings, value.number, rule);
    }
    return true;
}

void complain(const SettingRow& row, const Value& value) {
    const SettingRule& rule = row.rule;
    if (rule.kind == SettingRule::NOT_EMPTY) {
        kdLogFormatMessage("%s", rule.complaint);
    } else if (rule.repair == SettingRule::NONE) {
        kdLogFormatMessage("%s %s", rule.complaint, value.text.c_str());
    } else if (row.type == Util::Bundle::STRING) {
        kdLogFormatMessage("%s: %s, setting to %s", rule.complaint, value.text.c_str(),
                           rule.settingTo);
    } else if (row.type == Util::Bundle::INT) {
        kdLogFormatMessage("%s: %d, setting to %s", rule.complaint, static_cast<int>(value.number),
                           rule.settingTo);
    } else {
        kdLogFormatMessage("%s: %f, setting to %s", rule.complaint, value.number, rule.settingTo);
    }
}

/** The default if the upper confidence leaves room for it. */
double defaultBelowUpper(const Settings& settings, const SettingRow& row) {
    const auto byDefault = static_cast<float>(row.numberDefault);
    return settings.getFloat(Settings::SKS_UPPER_CONFIDENCE) > byDefault ? row.numberDefault : 0.0;
}

void repair(Settings& settings, const SettingRow& row, const Value& value) {
    const SettingRule& rule = row.rule;
    switch (rule.repair) {
        case SettingRule::NONE:
            break;
        case SettingRule::TO_REPLACEMENT:
            settings.putString(row.key, *rule.replacement);
            break;
        case SettingRule::TO_DEFAULT:
            writeNumber(settings, row, row.numberDefault);
            break;
        case SettingRule::TO_NEARER_END:
            writeNumber(settings, row, value.number < rule.lowest ? rule.lowest : rule.highest);
            break;
        case SettingRule::TO_DEFAULT_OR_ZERO:
            writeNumber(settings, row, defaultBelowUpper(settings, row));
            break;
    }
}

void validateKey(Settings& settings, const SettingRow& row) {
    const Value value = readValue(settings, row);
    if (!isGood(settings, row.rule, value)) {
        complain(row, value);
        repair(settings, row, value);
    }
}

}  // namespace

void requireConformance(const Settings& settings) {
    KOR_ASSERT_AT(settings.conformsTo(Settings::bundleSpecs), "conformsTo(bundleSpecs)",
                  "talvox/Talvox", __LINE__);
}

Settings::Settings() {
    for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
        writeDefault(*this, *row);
    }
    requireConformance(*this);
}

Settings::~Settings() = default;

boost::shared_ptr<Settings> Settings::clone() const {
    return boost::make_shared<Settings>(*this);
}

const std::string& Settings::getUrl() const {
    return getString(SKS_URL);
}

const std::string& Settings::getUuid() const {
    return getString(SKS_UUID);
}

const std::string& Settings::getLanguage() const {
    return getString(RS_LANGUAGE);
}

const std::string& Settings::getModel() const {
    return getString(RS_MODEL);
}

const std::string& Settings::getSessionId() const {
    return getString(RS_SESSION_ID);
}

int Settings::getSampleRate() const {
    return getInt(SKS_SAMPLE_RATE);
}

void Settings::validate() {
    for (const SettingRule::Turn turn : {SettingRule::ENGINE_TEXTS, SettingRule::CONFIDENCES,
                                         SettingRule::NUMBERS, SettingRule::RECOGNIZER_TEXTS}) {
        for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
            if (row->rule.turn == turn && row->rule.kind != SettingRule::ANY) {
                validateKey(*this, *row);
            }
        }
    }
}

}  // namespace Talvox
