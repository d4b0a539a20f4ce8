#include "SourceScanner.h"

#include <algorithm>
#include <cctype>
#include <fstream>
#include <iterator>
#include <map>
#include <regex>

namespace DocsTest {

namespace {

namespace fs = std::filesystem;

const char* const UNREADABLE = "UNREADABLE";

/** Functions that pass their last argument on as the text of a check, and where that stands. */
const std::map<std::string, std::string> PASSED_ON_BY = {
    {"util/Bundle.cpp", "getTyped"}, {"platforms/android/jni/Engine.cpp", "makeSettings"}};

struct Source {
    std::string name; /**< relative to the project */
    std::string text; /**< without comments */
};

std::string readFile(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

/** The end of a literal, of a comment or of one character that starts at `i`. */
std::size_t findTokenEnd(const std::string& text, std::size_t i) {
    const auto endAfter = [&text, i](const char* mark) {
        const std::size_t found = text.find(mark, i + 2);
        return found == std::string::npos ? text.size() : found + std::string(mark).size();
    };
    if (text.compare(i, 2, "//") == 0) {
        return std::min(text.find('\n', i), text.size());
    }
    if (text.compare(i, 2, "/*") == 0) {
        return endAfter("*/");
    }
    if (text.compare(i, 3, "R\"(") == 0) {
        return endAfter(")\"");
    }
    // An apostrophe after a digit groups digits.
    const bool isGroup = text[i] == '\'' && i > 0 && std::isalnum(text[i - 1]) != 0;
    std::size_t end = i + 1;
    if (text[i] == '"' || (text[i] == '\'' && !isGroup)) {
        while (end < text.size() && text[end] != text[i]) {
            end += text[end] == '\\' ? 2 : 1;
        }
        ++end;
    }
    return std::min(end, text.size());
}

std::string removeComments(const std::string& text) {
    std::string result;
    for (std::size_t i = 0; i < text.size();) {
        const std::size_t end = findTokenEnd(text, i);
        if (text.compare(i, 2, "//") != 0 && text.compare(i, 2, "/*") != 0) {
            result.append(text, i, end - i);
        }
        i = end;
    }
    return result;
}

/** The arguments of a call whose opening parenthesis is at `open`, without blanks around them. */
std::vector<std::string> splitArguments(const std::string& text, std::size_t open) {
    std::vector<std::string> arguments(1);
    int depth = 0;
    bool isText = false;
    for (std::size_t i = open; i < text.size(); ++i) {
        const char c = text[i];
        if (isText) {
            isText = c != '"';
            arguments.back() += c;
            if (c == '\\') {
                arguments.back() += text[++i];
            }
            continue;
        }
        isText = c == '"';
        depth += c == '(' ? 1 : (c == ')' ? -1 : 0);
        if (depth == 0) {
            break;
        }
        if (c == ',' && depth == 1) {
            arguments.emplace_back();
        } else if (i > open) {
            arguments.back() += c;
        }
    }
    for (std::string& argument : arguments) {
        argument.erase(0, argument.find_first_not_of(" \n"));
        argument.erase(argument.find_last_not_of(" \n") + 1);
    }
    return arguments;
}

/** The value of adjacent string literals, or of a constant of the same file; else empty. */
std::string valueOf(const std::string& expression, const std::string& text) {
    if (!expression.empty() && expression[0] != '"') {
        const std::regex constant("\\b" + expression +
                                  R"re((?:\[\])? =\s*((?:"(?:\\.|[^"\\])*"\s*)+);)re");
        std::smatch match;
        return std::regex_search(text, match, constant) ? valueOf(match[1].str(), text) : "";
    }
    std::string value;
    bool isInside = false;
    for (std::size_t i = 0; i < expression.size(); ++i) {
        if (expression[i] == '"') {
            isInside = !isInside;
        } else if (isInside) {
            value += expression[i] == '\\' ? expression[++i] : expression[i];
        }
    }
    return value;
}

std::vector<std::size_t> findCalls(const std::string& text, const std::string& name) {
    std::vector<std::size_t> opens;
    for (std::size_t at = text.find(name + "("); at != std::string::npos;
         at = text.find(name + "(", at + 1)) {
        const bool isWhole =
            at == 0 ||
            (std::isalnum(static_cast<unsigned char>(text[at - 1])) == 0 && text[at - 1] != '_');
        if (isWhole) {
            opens.push_back(at + name.size());
        }
    }
    return opens;
}

std::vector<Source> readSources(const fs::path& project) {
    std::vector<Source> sources;
    for (const char* folder : {"pal", "core", "libs", "talvox", "util", "logcollector",
                               "platforms/android/jni", "cli", "gateway", "tools"}) {
        for (const auto& entry : fs::recursive_directory_iterator(project / folder)) {
            const std::string name = entry.path().lexically_relative(project).generic_string();
            const std::string extension = entry.path().extension().string();
            if ((extension == ".cpp" || extension == ".h") &&
                name != "pal/include/pal/kd_assert.h") {
                sources.push_back({name, removeComments(readFile(entry.path()))});
            }
        }
    }
    return sources;
}

/** The texts that the callers of a function give as its last argument. */
std::vector<std::string> findPassedTexts(const std::vector<Source>& sources,
                                         const std::string& function) {
    std::vector<std::string> texts;
    for (const Source& source : sources) {
        for (const std::size_t open : findCalls(source.text, function)) {
            const std::string text = valueOf(splitArguments(source.text, open).back(), source.text);
            if (!text.empty()) {
                texts.push_back(text);
            }
        }
    }
    return texts;
}

void addPlainSites(const Source& source, std::vector<AssertionSite>& sites) {
    for (const std::size_t open : findCalls(source.text, "KOR_ASSERT")) {
        std::string condition;
        for (const std::string& part : splitArguments(source.text, open)) {
            condition += (condition.empty() ? "" : ", ") + part;
        }
        // As the preprocessor writes it.
        condition = std::regex_replace(condition, std::regex("\\s+"), " ");
        sites.push_back(
            {condition, fs::path(source.name).replace_extension().generic_string(), ""});
    }
}

void addFixedSites(const std::vector<Source>& sources, const Source& source,
                   std::vector<AssertionSite>& found) {
    for (const std::size_t open : findCalls(source.text, "KOR_ASSERT_AT")) {
        const std::vector<std::string> arguments = splitArguments(source.text, open);
        const std::size_t count = arguments.size();
        if (count < 4) {
            found.push_back({UNREADABLE, source.name, ""});
            continue;
        }
        const std::string path = valueOf(arguments[count - 2], source.text);
        const std::string line = arguments[count - 1] == "__LINE__" ? "" : arguments[count - 1];
        std::vector<std::string> texts = {valueOf(arguments[count - 3], source.text)};
        const auto function = PASSED_ON_BY.find(source.name);
        if (texts[0].empty() && function != PASSED_ON_BY.end()) {
            texts = findPassedTexts(sources, function->second);
        }
        for (const std::string& text : texts) {
            found.push_back(text.empty() || path.empty()
                                ? AssertionSite{UNREADABLE, source.name, line}
                                : AssertionSite{text, path, line});
        }
    }
}

void addCppTests(const std::string& text, std::vector<std::string>& names) {
    for (const char* macro : {"TEST", "TEST_F", "TEST_P"}) {
        for (const std::size_t open : findCalls(text, macro)) {
            const std::vector<std::string> arguments = splitArguments(text, open);
            if (arguments.size() == 2) {
                names.push_back(arguments[0] + "." + arguments[1]);
            }
        }
    }
}

void addJavaTests(const std::string& text, const std::string& type,
                  std::vector<std::string>& names) {
    const std::string method = "public void ";
    for (std::size_t at = text.find("@Test\n"); at != std::string::npos;
         at = text.find("@Test\n", at + 1)) {
        const std::size_t begin = text.find(method, at) + method.size();
        names.push_back(type + "." + text.substr(begin, text.find('(', begin) - begin));
    }
}

}  // namespace

std::vector<AssertionSite> findAssertionSites(const fs::path& project) {
    const std::vector<Source> sources = readSources(project);
    std::vector<AssertionSite> sites;
    for (const Source& source : sources) {
        addPlainSites(source, sites);
        addFixedSites(sources, source, sites);
    }
    std::sort(sites.begin(), sites.end());
    return sites;
}

std::vector<std::string> findTests(const fs::path& project) {
    std::vector<std::string> names;
    for (const char* folder : {"tests", "platforms/android/java/src/test"}) {
        for (const auto& entry : fs::recursive_directory_iterator(project / folder)) {
            const fs::path& path = entry.path();
            if (path.extension() == ".cpp") {
                addCppTests(readFile(path), names);
            } else if (path.extension() == ".java") {
                addJavaTests(readFile(path), path.stem().string(), names);
            }
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace DocsTest
