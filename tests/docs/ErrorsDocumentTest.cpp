// docs/ERRORS.md against the sources: every code, and every reason that the engine has words for.
#include <gmock/gmock.h>

#include <filesystem>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "support/ScratchDirectory.h"

namespace {

using ::testing::HasSubstr;
using TestSupport::ScratchDirectory;

const std::filesystem::path PROJECT(PROJECT_DIR);
const std::string ELLIPSIS = "…";

/** The recognizers' sources. */
const std::vector<std::string> RECOGNIZERS = {"talvox", "platforms/android/jni"};
/** With the network layer's, whose texts become reasons as well. */
const std::vector<std::string> ALL = {"talvox", "platforms/android/jni", "core/src/network"};

std::string readSources(const std::vector<std::string>& folders) {
    std::string sources;
    for (const std::string& folder : folders) {
        for (const auto& entry : std::filesystem::recursive_directory_iterator(PROJECT / folder)) {
            const std::filesystem::path& path = entry.path();
            if (path.extension() == ".cpp" || path.extension() == ".h") {
                sources += ScratchDirectory::read(path);
            }
        }
    }
    return sources;
}

template <typename Use>
void findAll(const std::string& text, const std::string& pattern, Use use) {
    const std::regex expression(pattern);
    for (std::sregex_iterator match(text.begin(), text.end(), expression), end; match != end;
         ++match) {
        use(*match);
    }
}

/** The first cells of the tables of reasons, without the backticks. */
std::set<std::string> readReasons(const std::string& page) {
    std::set<std::string> reasons;
    findAll(page, "\\n\\| `([^`]+)` \\|", [&reasons](const std::smatch& match) {
        const std::string text = match[1];
        if (text.find("Recorder") == std::string::npos && text.compare(0, 3, "...") != 0) {
            reasons.insert(text);
        }
    });
    return reasons;
}

/** The texts that the recognizers report with an error. */
std::set<std::string> findReportedReasons(const std::string& sources) {
    std::set<std::string> reasons;
    const auto addTexts = [&reasons](const std::smatch& statement) {
        findAll(statement[0], "\"((?:[^\"\\\\]|\\\\.)*)\"", [&reasons](const std::smatch& match) {
            reasons.insert(std::regex_replace(match[1].str(), std::regex("\\\\"), ""));
        });
    };
    findAll(
        sources,
        "(callOnError|stopWithError|fail|giveUp|end|endWithError|notifyError)\\((SpeechError\\()?"
        "SpeechError::[^;]*;",
        addTexts);
    findAll(sources, "(obstacle|REASON|reason) = [^;]*;", addTexts);
    return reasons;
}

TEST(ErrorsDocument, HasEveryCodeWithItsJavaName) {
    const std::string page = ScratchDirectory::read(PROJECT / "docs/ERRORS.md");
    const std::string java = ScratchDirectory::read(
        PROJECT / "platforms/android/java/src/main/java/korvel/talvox/SpeechError.java");
    int codes = 0;
    findAll(ScratchDirectory::read(PROJECT / "talvox/SpeechError.h"), "(Error[A-Za-z]+) = ([0-8]),",
            [&](const std::smatch& match) {
                ++codes;
                const std::string name = match[1];
                std::smatch constant;
                ASSERT_TRUE(
                    std::regex_search(java, constant, std::regex("([A-Z_]+)\\(\"" + name + "\"")))
                    << name;
                EXPECT_THAT(page, HasSubstr("\n| " + match[2].str() + " | `" + name + "` | `" +
                                            constant[1].str() + "` |"));
            });
    EXPECT_EQ(codes, 9);
}

TEST(ErrorsDocument, NamesOnlyReasonsThatTheSourcesHave) {
    const std::string sources = readSources(ALL);
    for (const std::string& reason :
         readReasons(ScratchDirectory::read(PROJECT / "docs/ERRORS.md"))) {
        std::string literal = reason.substr(0, reason.find(ELLIPSIS));
        literal = literal.substr(0, literal.find(" 503"));
        literal = std::regex_replace(literal, std::regex("\""), "\\\"");
        EXPECT_NE(sources.find('"' + literal), std::string::npos) << reason;
    }
}

TEST(ErrorsDocument, NamesEveryReasonThatARecognizerReports) {
    const std::set<std::string> listed =
        readReasons(ScratchDirectory::read(PROJECT / "docs/ERRORS.md"));
    const std::set<std::string> reported = findReportedReasons(readSources(RECOGNIZERS));
    EXPECT_GE(reported.size(), 15U);
    for (const std::string& reason : reported) {
        EXPECT_EQ(listed.count(reason), 1U) << reason;
    }
}

}  // namespace
