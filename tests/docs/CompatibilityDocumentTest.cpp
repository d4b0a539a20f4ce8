// docs/COMPATIBILITY.md against the sources: what it calls odd is still there.
#include <gtest/gtest.h>

#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "support/ScratchDirectory.h"

namespace {

using TestSupport::ScratchDirectory;

const std::filesystem::path PROJECT(PROJECT_DIR);

/** The text of a file, or of all files of a folder. */
std::string readSources(const std::filesystem::path& path) {
    if (!std::filesystem::is_directory(path)) {
        return ScratchDirectory::read(path);
    }
    std::string sources;
    for (const auto& entry : std::filesystem::directory_iterator(path)) {
        sources += entry.is_regular_file() ? ScratchDirectory::read(entry.path()) : std::string();
    }
    return sources;
}

/** The texts between backticks in the first cells of a row. */
std::vector<std::string> readCells(const std::string& row) {
    std::vector<std::string> cells;
    for (std::size_t begin = row.find("| `"); begin != std::string::npos && cells.size() < 2;) {
        const std::size_t end = row.find("` |", begin + 3);
        cells.push_back(row.substr(begin + 3, end - begin - 3));
        begin = end == std::string::npos ? end : row.find("| `", end + 2);
    }
    return cells;
}

TEST(CompatibilityDocument, NamesOnlyWhatTheSourcesHave) {
    std::istringstream page(ScratchDirectory::read(PROJECT / "docs/COMPATIBILITY.md"));
    int rows = 0;
    for (std::string line; std::getline(page, line);) {
        if (line.compare(0, 3, "| `") != 0) {
            continue;
        }
        ++rows;
        const std::vector<std::string> cells = readCells(line);
        ASSERT_EQ(cells.size(), 2U) << line;
        const std::string source = readSources(PROJECT / cells[1]);
        EXPECT_NE(source.find(cells[0]), std::string::npos)
            << cells[1] << " does not hold " << cells[0];
    }
    EXPECT_GT(rows, 40);
}

}  // namespace
