// Lets each call that can fail, fail: in one session after the other, once, or from there on.
//
// usage: tests_torture [KIND] [--session SESSION] [--call N] [--once | --onward] [--settled]
//                      [--sample COUNT] [--seed SEED] [--workers COUNT] [--verbose]
//                      [--write DOCUMENT]
//        tests_torture --check DOCUMENT
//        tests_torture --list
//
// Without options every point is run. Options narrow the choice down: --settled leaves out what is
// known to have faults, --sample takes so many points, by turns from each kind and session. --write
// replaces the tables of the document, --check compares its names with the program's. The exit
// status is 1 when a point has a fault or the document differs.
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>

#include "Campaign.h"
#include "Document.h"
#include "Plan.h"
#include "Victim.h"
#include "support/ChildProcess.h"
#include "support/PulseServer.h"

namespace {

using Torture::Campaign;
using Torture::Choice;

constexpr int ORDERS = 3;
constexpr int ANSWERS = 4;

std::string findProgram() {
    char path[PATH_MAX] = {};
    return ::readlink("/proc/self/exe", path, sizeof(path) - 1) > 0 ? path : "";
}

class Arguments {
  public:
    Arguments(int argc, char** argv) : count(argc), words(argv) {}

    bool take(const char* name) {
        if (index < count && std::string(words[index]) == name) {
            ++index;
            return true;
        }
        return false;
    }
    std::string takeValue() {
        if (index >= count) {
            throw std::invalid_argument("a value is missing");
        }
        return words[index++];
    }
    long takeNumber() { return std::stol(takeValue()); }
    bool areOver() const { return index >= count; }

  private:
    int count;
    char** words;
    int index = 1;
};

int takeName(Arguments& arguments, int (*find)(const std::string&)) {
    const std::string name = arguments.takeValue();
    const int index = find(name);
    if (index < 0) {
        throw std::invalid_argument("there is no " + name + "; --list shows what there is");
    }
    return index;
}

Choice readChoice(Arguments& arguments) {
    Choice choice;
    choice.program = findProgram();
    choice.library = TORTURE_LIBRARY;
    choice.workers = std::max(1U, std::thread::hardware_concurrency());
    while (!arguments.areOver()) {
        if (arguments.take("--session")) {
            choice.session = takeName(arguments, &Torture::findPlan);
        } else if (arguments.take("--call")) {
            choice.call = arguments.takeNumber();
        } else if (arguments.take("--once")) {
            choice.onward = 0;
        } else if (arguments.take("--onward")) {
            choice.onward = 1;
        } else if (arguments.take("--sample")) {
            choice.sample = static_cast<std::size_t>(arguments.takeNumber());
        } else if (arguments.take("--seed")) {
            choice.seed = static_cast<std::uint32_t>(arguments.takeNumber());
        } else if (arguments.take("--workers")) {
            choice.workers = static_cast<std::size_t>(arguments.takeNumber());
        } else if (arguments.take("--settled")) {
            choice.isSettled = true;
        } else if (arguments.take("--write")) {
            choice.document = arguments.takeValue();
        } else if (arguments.take("--verbose")) {
            choice.isVerbose = true;
        } else {
            choice.kind = takeName(arguments, &Torture::findKind);
        }
    }
    return choice;
}

void printNames() {
    for (int kind = 0; kind < Torture::KIND_COUNT; ++kind) {
        std::printf("kind %s\n", Torture::getName(static_cast<Torture::Kind>(kind)));
    }
    for (const Torture::Plan& plan : Torture::getPlans()) {
        std::printf("session %-16s %s\n", plan.name, plan.title);
    }
}

int checkDocument(const std::string& path) {
    const std::string difference = Torture::findDifference(path);
    if (!difference.empty()) {
        std::fprintf(stderr, "%s: %s\n./dev torture --write writes it.\n", path.c_str(),
                     difference.c_str());
    }
    return difference.empty() ? 0 : 1;
}

}  // namespace

int main(int argc, char** argv) {
    Arguments arguments(argc, argv);
    if (arguments.take("--serve")) {
        return Torture::serveOrders(ORDERS, ANSWERS);
    }
    if (arguments.take("--list")) {
        printNames();
        return 0;
    }
    try {
        if (arguments.take("--check")) {
            return checkDocument(arguments.takeValue());
        }
        const Choice choice = readChoice(arguments);
        // Workers take over the environment that leads to it. It ends when nobody uses it.
        const TestSupport::PulseServer pulse;
        const TestSupport::ChildProcess user({"sh", "-c", "exec pactl subscribe >/dev/null 2>&1"});
        Campaign campaign(choice);
        const bool isSound = campaign.run();
        if (!choice.document.empty()) {
            Torture::writeDocument(choice.document, campaign.getCells());
        }
        return isSound ? 0 : 1;
    } catch (const std::exception& exception) {
        std::fprintf(stderr, "tests_torture: %s\n", exception.what());
        return 2;
    }
}
