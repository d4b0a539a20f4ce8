#include "Document.h"

#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>

#include "Open.h"
#include "inject/Exclusions.h"

namespace Torture {

namespace {

const char* const BEGIN = "<!-- Written by ./dev torture --write. -->\n";
const char* const END = "<!-- End of what is written. -->\n";
const char* const HEAD =
    "| session | calls | points | unhurt | one error | refused | no such call | faults |\n"
    "|---|---|---|---|---|---|---|---|\n";

std::string read(const std::string& path) {
    std::ifstream file(path);
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    return {std::istreambuf_iterator<char>(file), {}};
}

/** What says the same in every run. */
std::string makeNames() {
    std::ostringstream text;
    text << "| session | what happens |\n|---|---|\n";
    for (const Plan& plan : getPlans()) {
        text << "| `" << plan.name << "` | " << plan.title << " |\n";
    }
    text << "\nNever fails, because the caller would end the process or be of no use "
            "afterwards:\n\n";
    for (const Exclusion& exclusion : EXCLUSIONS) {
        text << "- `" << getName(exclusion.kind) << "` in " << exclusion.library << ": "
             << exclusion.reason << "\n";
    }
    text << "\nLeft out of `./dev test`, because it has faults:\n\n";
    for (const Open& open : getOpen()) {
        text << "- `" << getName(open.kind) << "`"
             << (open.session != nullptr ? std::string(" in `") + open.session + "`" : "") << ": "
             << open.reason << "\n";
    }
    return text.str();
}

std::string makeHeading(Kind kind) {
    return std::string("\n## Outcomes: ") + getName(kind) + "\n\n";
}

std::string makeRow(const std::string& name, const Cell& cell) {
    std::ostringstream row;
    row << "| " << name << " | " << cell.calls << " | " << cell.getPoints();
    for (const long count : cell.endings) {
        row << " | " << count;
    }
    row << " | " << cell.faults << " |\n";
    return row.str();
}

std::string makeTable(Kind kind, const std::map<Campaign::Key, Cell>& cells) {
    std::string table = makeHeading(kind) + HEAD;
    Cell sum;
    for (std::size_t i = 0; i < getPlans().size(); ++i) {
        const auto found = cells.find({static_cast<int>(kind), static_cast<int>(i)});
        if (found == cells.end() || found->second.calls == 0) {
            continue;
        }
        const Cell& cell = found->second;
        table += makeRow(std::string("`") + getPlans()[i].name + "`", cell);
        sum.calls += cell.calls;
        sum.faults += cell.faults;
        for (std::size_t ending = 0; ending < sum.endings.size(); ++ending) {
            sum.endings[ending] += cell.endings[ending];
        }
    }
    return table + makeRow("all", sum);
}

}  // namespace

void writeDocument(const std::string& path, const std::map<Campaign::Key, Cell>& cells) {
    const std::string document = read(path);
    const std::size_t begin = document.find(BEGIN);
    const std::size_t end = document.find(END);
    if (begin == std::string::npos || end == std::string::npos) {
        throw std::runtime_error(path + " has no marks");
    }
    std::string written = BEGIN + std::string("\n") + makeNames();
    for (int kind = 0; kind < KIND_COUNT; ++kind) {
        written += makeTable(static_cast<Kind>(kind), cells);
    }
    std::ofstream(path) << document.substr(0, begin) << written << "\n" << document.substr(end);
}

std::string findDifference(const std::string& path) {
    const std::string document = read(path);
    if (document.find(makeNames()) == std::string::npos) {
        return "sessions, exclusions or what is left out differ:\n" + makeNames();
    }
    std::size_t place = 0;
    for (int kind = 0; kind < KIND_COUNT; ++kind) {
        const std::string heading = makeHeading(static_cast<Kind>(kind)) + HEAD;
        place = document.find(heading, place);
        if (place == std::string::npos) {
            return std::string("no table of the kind ") + getName(static_cast<Kind>(kind));
        }
        place += heading.size();
    }
    return document.find("\n## Outcomes: ", place) == std::string::npos ? "" : "one table too many";
}

}  // namespace Torture
