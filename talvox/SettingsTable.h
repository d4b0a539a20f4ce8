/**
 * @file
 * What is known about each setting, for tools and documents.
 */
#pragma once

#include <string>

#include "talvox/Export.h"
#include "talvox/Settings.h"
#include "util/Bundle.h"

namespace Talvox {

/**
 * What `Settings::validate` asks of a value, and what it does about a bad one. A value that is not
 * a number is bad where there is a range.
 */
struct SettingRule {
    /** Which values are good. */
    enum Kind {
        ANY,         /**< all; the value is not checked */
        NOT_EMPTY,   /**< every text but the empty one */
        UUID_LENGTH, /**< a text of `SettingsTable::UUID_BYTES` bytes */
        ONE_OF,      /**< the texts in `values` */
        RANGE        /**< the numbers from `lowest` to `highest` */
    };
    /** What becomes of a bad value. */
    enum Repair {
        NONE,               /**< it stays; a line in the log */
        TO_REPLACEMENT,     /**< `replacement`, a text */
        TO_DEFAULT,         /**< the default, a number */
        TO_NEARER_END,      /**< the end of the range that is nearer */
        TO_DEFAULT_OR_ZERO, /**< the default; 0 if the upper confidence is not above that */
    };
    /** `validate` checks all keys of one turn before those of the next. */
    enum Turn { ENGINE_TEXTS, CONFIDENCES, NUMBERS, RECOGNIZER_TEXTS };

    /** The most texts in `values`. */
    static constexpr unsigned VALUES_MAX = 8;

    /** Which values are good, what becomes of others, and when they are checked. */
    Kind kind = ANY;
    Repair repair = NONE;
    Turn turn = ENGINE_TEXTS;
    /** The ends of a range; both belong to it. */
    double lowest = 0;
    double highest = 0;
    /** The upper confidence limits the value as well. */
    bool isUpToUpperConfidence = false;
    /** Good texts; the first null ends them. */
    const std::string* values[VALUES_MAX + 1] = {};
    const std::string* replacement = nullptr;
    /** How the line in the log begins. */
    const char* complaint = nullptr;
    /** How the line names the new value. */
    const char* settingTo = "default";
};

/** One key. Texts point to constants, which are there before all static initialisers run. */
struct SettingRow {
    const char* constant;           /**< the name of the constant of `Settings` with the key */
    const char* key;                /**< as normalised */
    Util::Bundle::ElemType type;    /**< of the value */
    Settings::Level level;          /**< whose value counts */
    const std::string* textDefault; /**< of a text; else null */
    double numberDefault;           /**< of a boolean, 0 or 1, and of a number */
    SettingRule rule;               /**< for `Settings::validate` */
    const char* javaConstant;       /**< the name of the constant of Java's `TalvoxSettings` */
    const char* unit;               /**< may be empty */
    const char* effect;             /**< what the setting changes; whole sentences */
};

/**
 * The table from which `Settings` is made: constructor, `bundleSpecs`, `keyLevels` and `validate`
 * read it. Any thread; never blocks.
 */
class TALVOX_API SettingsTable {
  public:
    /** Length of the value of "uuid". */
    static constexpr unsigned UUID_BYTES = 32;

    /** Every key in the order of `Settings::bundleSpecs`; ended by a row with a null key. */
    static const SettingRow rows[];

    /** The row of a key in any spelling that normalises to it; null if there is none. */
    static const SettingRow* find(const std::string& key);
};

}  // namespace Talvox
