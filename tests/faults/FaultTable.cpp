#include "FaultTable.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <map>
#include <sstream>

#include "support/ScratchDirectory.h"

namespace FaultTest {

namespace {

/** Set: the tests rewrite the table instead of comparing with it. */
const char* const WRITE_VARIABLE = "TALVOX_WRITE_FAULTS";
const std::string BEGIN = "<!-- The table begins; written by tests_faults. -->\n";
const std::string END = "<!-- The table ends. -->\n";
const char* const HEAD =
    "| fault | mode | events, with seconds since the start | after speech | attempts | requests |\n"
    "|---|---|---|---|---|---|\n";

std::string readDocument() {
    return TestSupport::ScratchDirectory::read(FAULTS_DOCUMENT);
}

/** How a row begins: what tells it from the others. */
std::string makeKey(const Fault& fault, bool chunked) {
    return "| " + fault.what + " | " + (chunked ? "chunked" : "simple") + " | ";
}

std::string makeRow(const Fault& fault, bool chunked, const SessionOutcome& outcome) {
    std::string after = "–";
    if (outcome.speechEndMs >= 0) {
        const int64_t tenths = (outcome.endMs - outcome.speechEndMs) / BUFFER_MS;
        after = std::to_string(tenths / 10) + '.' + std::to_string(tenths % 10) + " s";
    }
    return makeKey(fault, chunked) + outcome.events + " | " + after + " | " +
           std::to_string(outcome.attempts) + " | " + std::to_string(outcome.requests) + " |";
}

std::vector<std::string> makeKeys() {
    std::vector<std::string> keys;
    for (const Chapter& chapter : getCatalogue()) {
        for (const Fault& fault : chapter.faults) {
            keys.push_back(makeKey(fault, false));
            keys.push_back(makeKey(fault, true));
        }
    }
    return keys;
}

/** Collects the rows and writes them at the end of the program. */
class Writer : public ::testing::Environment {
  public:
    void add(const std::string& key, const std::string& row) { rows[key] = row; }

    void TearDown() override {
        if (rows.empty()) {
            return;
        }
        const std::string document = readDocument();
        const std::size_t begin = document.find(BEGIN);
        const std::size_t end = document.find(END);
        ASSERT_NE(std::string::npos, begin) << FAULTS_DOCUMENT;
        ASSERT_NE(std::string::npos, end) << FAULTS_DOCUMENT;
        std::string table = BEGIN;
        for (const Chapter& chapter : getCatalogue()) {
            table += "\n### " + chapter.heading + "\n\n" + HEAD;
            for (const Fault& fault : chapter.faults) {
                table += takeRow(makeKey(fault, false)) + takeRow(makeKey(fault, true));
            }
        }
        ASSERT_FALSE(HasFailure()) << "the table was not written";
        std::ofstream(FAULTS_DOCUMENT) << document.substr(0, begin) << table << '\n'
                                       << document.substr(end);
    }

  private:
    std::string takeRow(const std::string& key) {
        EXPECT_EQ(1U, rows.count(key)) << "the whole catalogue has to run: " << key;
        return rows[key] + '\n';
    }

    static bool HasFailure() { return ::testing::UnitTest::GetInstance()->Failed(); }

    std::map<std::string, std::string> rows;
};

Writer* makeWriter() {
    if (std::getenv(WRITE_VARIABLE) == nullptr) {
        return nullptr;
    }
    auto* const writer = new Writer;
    ::testing::AddGlobalTestEnvironment(writer);
    return writer;
}

// GoogleTest must know it before the tests run.
Writer* const writer = makeWriter();

}  // namespace

void checkTable(const Fault& fault, bool chunked, const SessionOutcome& outcome) {
    const std::string row = makeRow(fault, chunked, outcome);
    if (writer != nullptr) {
        writer->add(makeKey(fault, chunked), row);
        return;
    }
    EXPECT_NE(std::string::npos, readDocument().find('\n' + row + '\n'))
        << "docs/FAULTS.md does not have the row\n"
        << row << "\nIf that is right, rewrite it: " << WRITE_VARIABLE
        << "=1 build/debug/tests/tests_faults --gtest_filter='*Catalogue*'";
}

void checkRows() {
    if (writer != nullptr) {
        return;
    }
    std::istringstream document(readDocument());
    std::vector<std::string> found;
    for (std::string line; std::getline(document, line);) {
        for (const std::string mode : {" | simple | ", " | chunked | "}) {
            const std::size_t place = line.find(mode);
            if (line.rfind("| ", 0) == 0 && place != std::string::npos) {
                found.push_back(line.substr(0, place + mode.size()));
            }
        }
    }
    EXPECT_EQ(makeKeys(), found);
}

}  // namespace FaultTest
