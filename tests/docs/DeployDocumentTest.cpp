// The time-outs of docs/DEPLOY.md against the code and the configurations, and against each other.
#include <gtest/gtest.h>

#include <cctype>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "support/ScratchDirectory.h"

namespace {

using TestSupport::ScratchDirectory;

const std::string PROJECT = std::string(PROJECT_DIR) + "/";

struct TimeOut {
    std::string who;
    std::string waitsFor;
    int seconds = 0;
    std::string file;
    std::string text;
};

std::string trim(const std::string& text) {
    const std::size_t begin = text.find_first_not_of(" `");
    return begin == std::string::npos ? ""
                                      : text.substr(begin, text.find_last_not_of(" `") - begin + 1);
}

/** The rows of the table whose file and text are in backticks. */
std::vector<TimeOut> readTable() {
    std::vector<TimeOut> table;
    std::istringstream lines(ScratchDirectory::read(PROJECT + "docs/DEPLOY.md"));
    for (std::string line; std::getline(lines, line);) {
        std::vector<std::string> cells;
        std::istringstream row(line);
        for (std::string cell; std::getline(row, cell, '|');) {
            cells.push_back(trim(cell));
        }
        if (cells.size() == 6 && cells[3].find(" s") != std::string::npos) {
            table.push_back({cells[1], cells[2], std::stoi(cells[3]), cells[4], cells[5]});
        }
    }
    return table;
}

/** The time at the end of a text such as "TIMEOUT_MS = 30000" or "timeout client 35s". */
int readSeconds(const std::string& text) {
    const std::size_t blank = text.rfind(' ');
    const int number = std::stoi(text.substr(blank + 1));
    return text.find("_MS") == std::string::npos ? number : number / 1000;
}

TEST(DeployDocument, HasTheTimeOutsOfTheCode) {
    const std::vector<TimeOut> table = readTable();
    ASSERT_EQ(14U, table.size());
    for (const TimeOut& row : table) {
        const std::string source = ScratchDirectory::read(PROJECT + row.file);
        const std::size_t found = source.find(row.text);
        ASSERT_NE(std::string::npos, found) << row.file << " has no " << row.text;
        const char next = source[found + row.text.size()];
        EXPECT_FALSE(std::isalnum(static_cast<unsigned char>(next)) != 0) << row.text;
        EXPECT_EQ(row.seconds, readSeconds(row.text)) << row.text;
    }
}

TEST(DeployDocument, HasTimeOutsThatFitTogether) {
    std::map<std::string, int> seconds;
    for (const TimeOut& row : readTable()) {
        seconds[row.who + ": " + row.waitsFor] = row.seconds;
    }
    const auto get = [&seconds](const std::string& name) {
        EXPECT_EQ(1U, seconds.count(name)) << name;
        return seconds[name];
    };
    const int answer = get("client: the answer, both attempts included");
    const int connection = get("client: a connection, and room for bytes that are ready");
    const int idle = get("gateway: the next bytes, and the next request");
    EXPECT_LT(2 * get("gateway: a free decoder") + get("client: the second attempt"), answer);
    for (const std::string front : {"nginx", "haproxy"}) {
        EXPECT_GT(get(front + ": the answer"), answer);
        EXPECT_GT(get(front + ": the client's next bytes"), idle);
        EXPECT_LT(get(front + ": a connection to the gateway"), connection);
    }
    EXPECT_LT(get("nginx: the next request to the gateway"), idle);
}

TEST(DeployDocument, GivesOneGatewayTheTimeOutsOfSeveral) {
    for (const char* const kind : {"nginx-%.conf", "haproxy-%.cfg"}) {
        std::map<std::string, std::string> lines;
        for (const char* const count : {"one", "many"}) {
            std::string name = kind;
            name.replace(name.find('%'), 1, count);
            std::istringstream file(
                ScratchDirectory::read(std::string(PROJECT).append("docs/deploy/").append(name)));
            for (std::string line; std::getline(file, line);) {
                const bool isTimeOut = line.find('#') == std::string::npos &&
                                       line.find("timeout ") != std::string::npos &&
                                       line.find("proxy_next") == std::string::npos;
                if (isTimeOut) {
                    lines[count].append(line).append("\n");
                }
            }
        }
        EXPECT_NE("", lines["one"]);
        EXPECT_EQ(lines["one"], lines["many"]);
    }
}

}  // namespace
