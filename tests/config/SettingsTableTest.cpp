// The table of settings against the header with its constants, the settings that are made from it
// and the Java kit's keys.
#include "talvox/SettingsTable.h"

#include <gmock/gmock.h>

#include <map>
#include <regex>
#include <set>
#include <string>

#include "support/ScratchDirectory.h"

namespace {

using Talvox::SettingRow;
using Talvox::SettingRule;
using Talvox::Settings;
using Talvox::SettingsTable;
using ::testing::HasSubstr;
using TestSupport::ScratchDirectory;
using Util::Bundle;

const std::string SOURCES(PROJECT_DIR);
const std::string JAVA = SOURCES + "/platforms/android/java/src/main/java/korvel/talvox/";

template <typename Use>
void forEachRow(Use use) {
    for (const SettingRow* row = SettingsTable::rows; row->key != nullptr; ++row) {
        SCOPED_TRACE(row->key);
        use(*row);
    }
}

/** A key of the Java kit as its declaration has it. */
struct JavaKey {
    std::string constant;
    std::string maker; /**< what follows "of" in the name of the function that makes it */
    std::string level;
    std::string check;
};

/** By the name of the setting. */
std::map<std::string, JavaKey> readJavaKeys() {
    const std::string source = ScratchDirectory::read(JAVA + "TalvoxSettings.java");
    const std::regex declaration(
        "public static final SettingKey<\\w+> (\\w+) =\\s*"
        "SettingKey\\.of(\\w+)\\(\\s*\"(\\w+)\",\\s*(\\w+)(?:,\\s*([^;]*))?\\);");
    std::map<std::string, JavaKey> keys;
    for (std::sregex_iterator match(source.begin(), source.end(), declaration), end; match != end;
         ++match) {
        keys[(*match)[3]] = {(*match)[1], (*match)[2], (*match)[4], (*match)[5]};
    }
    return keys;
}

/** The texts of a Java enumeration's constants. */
std::set<std::string> readJavaTexts(const std::string& type) {
    const std::string source = ScratchDirectory::read(JAVA + type + ".java");
    const std::regex constant("\\n    [A-Z_]+\\(\"([^\"]*)\"\\)");
    std::set<std::string> texts;
    for (std::sregex_iterator match(source.begin(), source.end(), constant), end; match != end;
         ++match) {
        texts.insert((*match)[1]);
    }
    return texts;
}

std::set<std::string> goodTexts(const SettingRule& rule) {
    std::set<std::string> texts;
    for (const std::string* const* value = rule.values; *value != nullptr; ++value) {
        texts.insert(**value);
    }
    return texts;
}

std::string javaMaker(const SettingRow& row) {
    switch (row.type) {
        case Bundle::BOOLEAN:
            return "Boolean";
        case Bundle::INT:
            return "Integer";
        case Bundle::FLOAT:
            return "Float";
        case Bundle::LATLON:
            return "Position";
        default:
            return row.rule.kind == SettingRule::ONE_OF ? "Choice" : "Text";
    }
}

/** The check of a range as Java writes it. */
std::string javaRange(const SettingRow& row) {
    if (row.rule.highest > 1e9) {
        return "SettingChecks.notNegative()";
    }
    const std::string suffix = row.type == Bundle::FLOAT ? "f" : "";
    return "SettingChecks.range(" + std::to_string(static_cast<int>(row.rule.lowest)) + suffix +
           ", " + std::to_string(static_cast<int>(row.rule.highest)) + suffix + ")";
}

TEST(SettingsTable, EachRowNamesAConstantOfSettingsAndSaysWhatTheKeyDoes) {
    const std::string header = ScratchDirectory::read(SOURCES + "/talvox/Settings.h");
    std::set<std::string> declared;
    const std::regex declaration("static const std::string ((SKS|RS)_\\w+);");
    for (std::sregex_iterator match(header.begin(), header.end(), declaration), end; match != end;
         ++match) {
        declared.insert((*match)[1]);
    }
    std::set<std::string> named;
    forEachRow([&named](const SettingRow& row) {
        named.insert(row.constant);
        EXPECT_EQ(std::string(row.effect).back(), '.');
        EXPECT_EQ(Bundle::normalizeKey(row.key), row.key);
    });
    EXPECT_EQ(named, declared);
}

TEST(SettingsTable, EveryDefaultIsAGoodValueButForAddressAndIdentifier) {
    forEachRow([](const SettingRow& row) {
        const SettingRule& rule = row.rule;
        EXPECT_EQ(row.textDefault != nullptr, row.type == Bundle::STRING);
        if (rule.kind == SettingRule::ONE_OF) {
            EXPECT_EQ(goodTexts(rule).count(*row.textDefault), 1U);
            EXPECT_EQ(goodTexts(rule).count(*rule.replacement), 1U);
        } else if (rule.kind == SettingRule::RANGE) {
            EXPECT_GE(row.numberDefault, rule.lowest);
            EXPECT_LE(row.numberDefault, rule.highest);
        }
        EXPECT_EQ(rule.complaint != nullptr, rule.kind != SettingRule::ANY);
    });
}

TEST(SettingsTable, FindsAKeyInAnySpelling) {
    ASSERT_NE(SettingsTable::find("Sample_Rate"), nullptr);
    EXPECT_STREQ(SettingsTable::find("Sample_Rate")->key, "samplerate");
    EXPECT_EQ(SettingsTable::find("colour"), nullptr);
    EXPECT_EQ(SettingsTable::find(""), nullptr);
}

TEST(SettingsTable, TheJavaKitHasTheSameKeysTypesLevelsAndValues) {
    std::map<std::string, JavaKey> keys = readJavaKeys();
    forEachRow([&keys](const SettingRow& row) {
        ASSERT_EQ(keys.count(row.key), 1U);
        const JavaKey& key = keys[row.key];
        EXPECT_EQ(key.constant, row.javaConstant);
        EXPECT_EQ(key.maker, javaMaker(row));
        const bool isOfEngine =
            row.level == Settings::Level::ENGINE || row.level == Settings::Level::ENGINE_FOR_CLOUD;
        EXPECT_EQ(key.level, isOfEngine ? "ENGINE" : "BOTH");
        if (row.rule.kind == SettingRule::RANGE) {
            EXPECT_EQ(key.check, javaRange(row));
        } else if (row.rule.kind == SettingRule::ONE_OF) {
            const std::string type = key.check.substr(0, key.check.find('.'));
            EXPECT_EQ(readJavaTexts(type), goodTexts(row.rule)) << type;
        }
        keys.erase(row.key);
    });
    EXPECT_TRUE(keys.empty()) << keys.begin()->first;
}

TEST(SettingsTable, TheJavaKitListsEachKeyAndSaysWhereItCounts) {
    const std::string source = ScratchDirectory::read(JAVA + "TalvoxSettings.java");
    const std::string list = source.substr(source.find("KEYS ="));
    const std::string table = source.substr(0, source.find("public final class"));
    forEachRow([&](const SettingRow& row) {
        EXPECT_THAT(list.substr(0, list.find(';')), HasSubstr(std::string(" ") + row.javaConstant));
        EXPECT_THAT(table, HasSubstr(std::string("{@link #") + row.javaConstant + "}"));
    });
}

}  // namespace
