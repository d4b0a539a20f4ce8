#include "Judge.h"

#include <sys/wait.h>

#include <algorithm>
#include <cstring>

#include "talvox/SpeechError.h"

namespace Torture {

namespace {

using Faults = std::vector<std::string>;

/** Longer than the two seconds that the documents allow: sanitizers search for leaks in it. */
constexpr std::int64_t EXIT_LIMIT_MS = 6000;

/** 20 s of sound, and 20 s without an answer since; time moves in steps of 500 ms. */
constexpr std::int64_t END_LIMIT_MS = 41000;

/** Each session has a gateway of its own. */
constexpr std::size_t CONNECTIONS_KEPT = 2;

const char* getName(Stage stage) {
    switch (stage) {
        case Stage::PREPARES:
            return "before the session";
        case Stage::SESSION:
            return "in the session";
        case Stage::NEXT_SESSION:
            return "in the session that follows";
        case Stage::SETTLES:
            return "after the sessions";
        case Stage::EXITS:
            break;
    }
    return "at the end of the process";
}

std::string describe(const SessionOutcome& outcome) {
    std::string text = std::to_string(outcome.ends) + " ends";
    text += outcome.results != 0 ? ", results" : "";
    text += outcome.error >= 0 ? ", error " + std::to_string(outcome.error) : "";
    return text;
}

void checkProcess(const Verdict& verdict, Faults& faults) {
    const std::string place = getName(verdict.report.stage);
    if (verdict.timedOut != 0) {
        faults.push_back("hangs " + place);
    } else if (WIFSIGNALED(verdict.status)) {
        faults.push_back(std::string("crashes ") + place + ": " +
                         strsignal(WTERMSIG(verdict.status)));
    } else if (verdict.status != 0) {
        faults.push_back("exits with status " + std::to_string(WEXITSTATUS(verdict.status)) + " " +
                         place);
    } else if (verdict.exitMs > EXIT_LIMIT_MS) {
        faults.push_back("takes " + std::to_string(verdict.exitMs) + " ms to exit");
    }
}

void checkException(const SessionOutcome& outcome, Faults& faults) {
    if (outcome.exception[0] != '\0') {
        faults.push_back(std::string("an exception leaves ") + outcome.exception);
    }
}

/** One end, in time, and an error with a line in the log; after a release none has to come. */
void checkEnd(const Plan& plan, const SessionOutcome& outcome, Faults& faults) {
    const bool isReleased = plan.ending == Plan::Ending::RELEASE;
    if (outcome.created == 0) {
        return;
    }
    if (outcome.ends > 1 || (outcome.ends == 0 && !isReleased)) {
        faults.push_back("the session has " + describe(outcome));
    }
    if (outcome.endMs > END_LIMIT_MS) {
        faults.push_back("the session ends after " + std::to_string(outcome.endMs) + " ms");
    }
    if (outcome.error >= 0 && outcome.logged == 0) {
        faults.push_back("an error without a line in the log");
    }
    if (outcome.wrongText != 0) {
        faults.push_back("results that the gateway did not give");
    }
}

/** The sound of a capture has no fixed length. */
bool isComparable(const Plan& plan) {
    return plan.sound != Plan::Sound::SERVER;
}

bool isWhole(const Plan& plan, const std::vector<std::string>& bodies,
             const std::vector<std::string>& wanted) {
    if (bodies.empty() || wanted.empty()) {
        return false;
    }
    return !isComparable(plan) || bodies.back() == wanted.back() ||
           (plan.speex && bodies.back().size() == wanted.back().size());
}

void checkTraffic(const Plan& plan, const Reference& reference, const SessionOutcome& outcome,
                  const Traffic& traffic, Faults& faults) {
    if (outcome.results != 0 && !isWhole(plan, traffic.first, reference.traffic.first)) {
        faults.push_back("results of a request that was not whole");
    }
    if (!reference.traffic.next.empty() && !isWhole(plan, traffic.next, reference.traffic.next)) {
        faults.push_back("the session that follows sends another request");
    }
}

void checkNext(const SessionOutcome& wanted, const SessionOutcome& outcome, Faults& faults) {
    if (outcome.created != wanted.created || outcome.ends != wanted.ends ||
        outcome.results != wanted.results || outcome.error != wanted.error) {
        faults.push_back("the session that follows has " + describe(outcome));
    }
}

void checkCount(std::size_t found, std::size_t wanted, const char* what, Faults& faults) {
    if (found != wanted) {
        faults.push_back(std::to_string(found) + " " + what + " instead of " +
                         std::to_string(wanted));
    }
}

void checkRest(const Holdings& wanted, const Report& report, Faults& faults) {
    checkCount(report.holdings.threads, wanted.threads, "threads", faults);
    checkCount(report.holdings.descriptors, wanted.descriptors, "descriptors", faults);
    // One that broke is not kept; one whose request failed may be, beside that of the next session.
    if (report.holdings.connections > std::max(wanted.connections, CONNECTIONS_KEPT)) {
        checkCount(report.holdings.connections, wanted.connections, "connections", faults);
    }
    if (report.dumpFault[0] != '\0') {
        faults.emplace_back(report.dumpFault);
    }
    if (report.pendingRecords > 0) {
        faults.push_back(std::to_string(report.pendingRecords) + " usage records stick");
    }
}

bool isLike(const SessionOutcome& outcome, const SessionOutcome& wanted) {
    return outcome.created == wanted.created && outcome.ends == wanted.ends &&
           outcome.results == wanted.results && outcome.error == wanted.error;
}

Ending findEnding(const SessionOutcome& outcome, const Report& report,
                  const SessionOutcome& wanted) {
    if (report.failed[0] == '\0') {
        return Ending::UNREACHED;
    }
    if (outcome.created == 0) {
        return Ending::REFUSED;
    }
    return isLike(outcome, wanted) ? Ending::UNHURT : Ending::ERROR;
}

}  // namespace

Judgement judge(const Plan& plan, const Reference& reference, const Order& /*order*/,
                const Answer& answer, const Traffic& traffic) {
    Judgement judgement;
    Faults& faults = judgement.faults;
    if (!answer.served) {
        faults.emplace_back("the process that looks after victims is gone");
        return judgement;
    }
    const Report& report = answer.verdict.report;
    judgement.ending = findEnding(report.first, report, reference.report.first);
    checkProcess(answer.verdict, faults);
    checkException(report.first, faults);
    if (report.stage > Stage::SESSION) {
        checkEnd(plan, report.first, faults);
    }
    if (report.stage > Stage::NEXT_SESSION) {
        checkException(report.next, faults);
        checkNext(reference.report.next, report.next, faults);
        checkTraffic(plan, reference, report.first, traffic, faults);
    }
    if (report.stage == Stage::EXITS) {
        checkRest(reference.report.holdings, report, faults);
    }
    return judgement;
}

Faults judgeReference(const Plan& plan, const Answer& answer, const Traffic& traffic) {
    Reference own;
    own.report = answer.verdict.report;
    own.traffic = traffic;
    Judgement judgement = judge(plan, own, Order(), answer, traffic);
    const bool hasVoice = plan.ending != Plan::Ending::NO_VOICE;
    if (own.report.next.results == 0 && hasVoice) {
        judgement.faults.emplace_back("the session that follows has no results");
    }
    return judgement.faults;
}

}  // namespace Torture
