#include "SettingsPage.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "Text.h"
#include "talvox/SettingsTable.h"

namespace Cli {

namespace {

using Talvox::SettingRow;
using Talvox::SettingRule;
using Talvox::Settings;
using Talvox::SettingsTable;
using Util::Bundle;

const std::size_t HELP_COLUMNS = 90;
const std::size_t KEY_COLUMNS = 24;

const char* const PAGE_BEGIN =
    "# Settings\n"
    "\n"
    "<!-- Written by ./dev pages from talvox/impl/SettingRows.inc. Do not edit. -->\n"
    "\n"
    "A setting is a key with a value of one type. An application sets values on the engine, on "
    "one\n"
    "recognizer, or both; a key that is not set has its default.\n"
    "\n"
    "| from | with |\n"
    "|---|---|\n"
    "| C++ | `Talvox::Settings`, whose constants are the keys; `Talvox::setTalvoxSettings` for the "
    "engine, `createRecognizer` for one recognizer |\n"
    "| Java | `TalvoxSettings`; `TalvoxEngine.updateSettings`, `createRecognizer` |\n"
    "| XML | the children of the element `/startup/features/voice`, one for each key |\n"
    "| the tool | `--set KEY=VALUE`, `--settings FILE.xml` |\n"
    "\n"
    "`Sample_Rate`, `sample-rate` and `SAMPLE RATE` are `samplerate` to C++, XML and the tool.\n"
    "\n"
    "**Bad values.** `createRecognizer` repairs them in a copy of the recognizer's settings, and\n"
    "logs a line for each. Nobody repairs the engine's own settings; call `Settings::validate`\n"
    "before you install values from outside. Java's builders refuse bad values instead.\n"
    "\n"
    "**Where a value counts.** A value that is set where it does not count has no effect.\n"
    "`createRecognizer` logs each such value that differs from the engine's; Java's\n"
    "`createRecognizer` refuses it. What one recognition does not set in Java has the engine's\n"
    "value.\n"
    "\n";

std::string code(const std::string& text) {
    return '`' + text + '`';
}

std::string numberText(double number) {
    std::string text = fixed(number, 0, 3);
    text.erase(text.find_last_not_of('0') + 1);
    return text.back() == '.' ? text.substr(0, text.size() - 1) : text;
}

std::string defaultText(const SettingRow& row) {
    switch (row.type) {
        case Bundle::BOOLEAN:
            return row.numberDefault != 0 ? "true" : "false";
        case Bundle::STRING:
            return row.textDefault->empty() ? "empty" : code(*row.textDefault);
        case Bundle::LATLON:
            return "0,0";
        default:
            return numberText(row.numberDefault);
    }
}

std::string goodTexts(const SettingRule& rule) {
    std::string list;
    for (const std::string* const* value = rule.values; *value != nullptr; ++value) {
        list += (list.empty() ? "" : ", ") + code(**value);
    }
    return list;
}

std::string rangeText(const SettingRule& rule) {
    if (rule.isUpToUpperConfidence) {
        return numberText(rule.lowest) + " to " + code(Settings::SKS_UPPER_CONFIDENCE);
    }
    return std::isinf(rule.highest) ? numberText(rule.lowest) + " or more"
                                    : numberText(rule.lowest) + " to " + numberText(rule.highest);
}

std::string valuesText(const SettingRow& row) {
    switch (row.rule.kind) {
        case SettingRule::NOT_EMPTY:
            return "not empty";
        case SettingRule::UUID_LENGTH:
            return std::to_string(SettingsTable::UUID_BYTES) + " bytes";
        case SettingRule::ONE_OF:
            return goodTexts(row.rule);
        case SettingRule::RANGE:
            return rangeText(row.rule);
        case SettingRule::ANY:
            break;
    }
    return row.type == Bundle::BOOLEAN ? "true, false" : "any";
}

std::string typeText(const SettingRow& row) {
    static const char* const NAMES[] = {"boolean", "integer", "float", "position", "text"};
    return std::string(NAMES[row.type]) + (*row.unit != '\0' ? std::string(", ") + row.unit : "");
}

std::string levelText(Settings::Level level) {
    switch (level) {
        case Settings::Level::ENGINE:
            return "engine";
        case Settings::Level::ENGINE_FOR_CLOUD:
            return "engine; for the device recognizer: recognizer";
        case Settings::Level::RECOGNIZER:
            return "recognizer";
        case Settings::Level::BOTH:
            break;
    }
    return "both";
}

std::string repairText(const SettingRow& row) {
    switch (row.rule.repair) {
        case SettingRule::TO_REPLACEMENT:
            return "becomes " + code(*row.rule.replacement);
        case SettingRule::TO_DEFAULT:
            return "becomes " + numberText(row.numberDefault);
        case SettingRule::TO_NEARER_END:
            return "becomes " + numberText(row.rule.lowest) + " or " +
                   numberText(row.rule.highest) + ", whichever is nearer";
        case SettingRule::TO_DEFAULT_OR_ZERO:
            return "becomes " + numberText(row.numberDefault) + ", or 0 if " +
                   code(Settings::SKS_UPPER_CONFIDENCE) + " is not above that";
        case SettingRule::NONE:
            break;
    }
    return "stays";
}

std::string complaintText(const SettingRow& row) {
    const std::string complaint = row.rule.complaint;
    if (row.rule.kind == SettingRule::NOT_EMPTY) {
        return code(complaint);
    }
    return code(row.rule.repair == SettingRule::NONE
                    ? complaint + " VALUE"
                    : complaint + ": VALUE, setting to " + row.rule.settingTo);
}

std::string summaryOf(const SettingRow& row) {
    return "| [" + code(row.key) + "](#" + row.key + ") | " + typeText(row) + " | " +
           valuesText(row) + " | " + defaultText(row) + " | " + levelText(row.level) + " |\n";
}

std::string sectionOf(const SettingRow& row) {
    std::string section = "\n## " + std::string(row.key) + "\n\n" + row.effect + "\n\n";
    if (row.rule.kind == SettingRule::ANY) {
        section += "- Not checked.\n";
    } else {
        section += "- A bad value " + repairText(row) + ". Log: " + complaintText(row) + "\n";
    }
    return section + "- C++: `Settings::" + row.constant + "`. Java: `TalvoxSettings." +
           row.javaConstant + "`.\n";
}

/** Text for a terminal: without backticks, and in lines that begin with blanks. */
std::string wrapped(std::string text, std::size_t indent) {
    text.erase(std::remove(text.begin(), text.end(), '`'), text.end());
    std::string lines;
    std::size_t used = HELP_COLUMNS;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find(' ', begin), text.size());
        if (used + 1 + end - begin > HELP_COLUMNS) {
            lines += (lines.empty() ? "" : "\n") + std::string(indent, ' ');
            used = indent;
        } else {
            lines += ' ';
            ++used;
        }
        lines.append(text, begin, end - begin);
        used += end - begin;
        begin = end + 1;
    }
    return lines + '\n';
}

std::string helpOf(const SettingRow& row) {
    const std::string values = valuesText(row) + " [" + defaultText(row) + "]" +
                               (*row.unit != '\0' ? std::string(" ") + row.unit : "");
    std::string key = wrapped(values, KEY_COLUMNS);
    key.replace(0, KEY_COLUMNS, padded(std::string("  ") + row.key, KEY_COLUMNS));
    return key + wrapped(row.effect, 6);
}

}  // namespace

std::string settingsHelp() {
    std::string help;
    for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
        help += helpOf(*row);
    }
    return help;
}

std::string settingsPage() {
    std::string page = PAGE_BEGIN;
    page += "| key | type | values | default | counts on |\n|---|---|---|---|---|\n";
    for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
        page += summaryOf(*row);
    }
    for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
        page += sectionOf(*row);
    }
    return page;
}

}  // namespace Cli
