// docs/ASSERTIONS.md against the sources: every check is in its table, and nothing else is.
#include <gmock/gmock.h>

#include <algorithm>
#include <fstream>
#include <regex>

#include "SourceScanner.h"

namespace {

using DocsTest::AssertionSite;
using ::testing::Contains;
using ::testing::ElementsAreArray;
using ::testing::IsEmpty;
using ::testing::Not;

const std::filesystem::path PROJECT(PROJECT_DIR);

struct Row {
    AssertionSite site;
    std::string afterwards;
    std::vector<std::string> tests;
};

/** The cells of a line of a table; a stroke inside a cell is written "\|". */
std::vector<std::string> splitCells(const std::string& line) {
    std::vector<std::string> cells(1);
    for (std::size_t i = 1; i < line.size(); ++i) {
        if (line[i] == '\\' && i + 1 < line.size() && line[i + 1] == '|') {
            cells.back() += line[++i];
        } else if (line[i] == '|') {
            cells.emplace_back();
        } else {
            cells.back() += line[i];
        }
    }
    cells.pop_back();
    return cells;
}

/** What stands between each pair of backticks. */
std::vector<std::string> findCode(const std::string& cell) {
    std::vector<std::string> found;
    std::size_t begin = cell.find('`');
    while (begin != std::string::npos) {
        const std::size_t end = cell.find('`', begin + 1);
        found.push_back(cell.substr(begin + 1, end - begin - 1));
        begin = end == std::string::npos ? end : cell.find('`', end + 1);
    }
    return found;
}

/** The rows whose first cell is a condition. */
std::vector<Row> readTable() {
    std::ifstream file(PROJECT / "docs/ASSERTIONS.md");
    std::vector<Row> rows;
    for (std::string line; std::getline(file, line);) {
        if (line.compare(0, 3, "| `") != 0) {
            continue;
        }
        const std::vector<std::string> cells = splitCells(line);
        EXPECT_EQ(cells.size(), 5U) << line;
        if (cells.size() == 5) {
            const std::string number = std::regex_replace(cells[2], std::regex(" "), "");
            rows.push_back({{findCode(cells[0]).at(0), findCode(cells[1]).at(0), number},
                            cells[3],
                            findCode(cells[4])});
        }
    }
    return rows;
}

TEST(AssertionsDocument, ListsEveryCheckAndNothingElse) {
    std::vector<AssertionSite> listed;
    for (const Row& row : readTable()) {
        listed.push_back(row.site);
    }
    std::sort(listed.begin(), listed.end());
    const std::vector<AssertionSite> found = DocsTest::findAssertionSites(PROJECT);
    EXPECT_GT(found.size(), 50U);
    EXPECT_THAT(listed, ElementsAreArray(found));
}

TEST(AssertionsDocument, SaysWhatFollowsEachReportAndNamesATestThatShowsIt) {
    const std::vector<std::string> tests = DocsTest::findTests(PROJECT);
    for (const Row& row : readTable()) {
        EXPECT_GT(row.afterwards.size(), 5U) << row.site.condition;
        EXPECT_THAT(row.tests, Not(IsEmpty())) << row.site.condition;
        for (const std::string& test : row.tests) {
            EXPECT_THAT(tests, Contains(test)) << row.site.condition;
        }
    }
}

}  // namespace
