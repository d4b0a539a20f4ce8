#include "Runner.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <iostream>
#include <sstream>

#include "Testbed.h"
#include "pal/kd_log.h"

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
extern "C" void __sanitizer_set_death_callback(void (*callback)());
#define LIFECYCLE_TELLS_SEED_AT_DEATH 1
#endif

namespace Lifecycle {

namespace {

std::uint64_t seedThatRuns = 0;

void writeCommand(std::ostream& out, std::uint64_t seed) {
    out << "repeat: build/PRESET/tests/tests_lifecycle --seed " << seed << " --sequences 1\n";
}

/** The process ends: the seed must be told before. */
void tellSeed() {
    std::fprintf(stderr,
                 "lifecycle: died in the sequence of seed %llu (--seed %llu --sequences 1)\n",
                 static_cast<unsigned long long>(seedThatRuns),
                 static_cast<unsigned long long>(seedThatRuns));
}

void onAbort(int /*signal*/) {
    tellSeed();
}

void ignoreLog(const char* /*message*/, void* /*user*/) {}

void writeLog(const char* message, void* user) {
    *static_cast<std::ostream*>(user) << "        log: " << message << "\n";
}

/** Leaves elements out as long as the sequence stays wrong. */
template <typename Element>
void thin(std::vector<Element>& elements, const std::function<bool()>& isStillWrong) {
    for (std::size_t i = elements.size(); i-- > 0;) {
        const Element left = elements[i];
        elements.erase(elements.begin() + static_cast<std::ptrdiff_t>(i));
        if (!isStillWrong()) {
            elements.insert(elements.begin() + static_cast<std::ptrdiff_t>(i), left);
        }
    }
}

/**
 * What comes of leaving out steps, reactions and faults as long as the sequence still goes wrong in
 * the same way.
 */
Sequence shorten(Testbed& testbed, const Sequence& sequence, const std::string& wrong) {
    Sequence shortest = sequence;
    const auto isStillWrong = [&] { return testbed.run(shortest) == wrong; };
    thin(shortest.steps, isStillWrong);
    for (SessionPlan& session : shortest.sessions) {
        thin(session.reactions, isStillWrong);
        thin(session.attempts, isStillWrong);
        const RecorderPlan habits = session.recorder;
        session.recorder = {};
        if (!isStillWrong()) {
            session.recorder = habits;
        }
    }
    for (Step& step : shortest.steps) {
        const Step whole = step;
        step.joined = step.networkStands = step.answersFirst = false;
        if (!isStillWrong()) {
            step = whole;
        }
    }
    return shortest;
}

std::string report(Testbed& testbed, const Sequence& sequence, const std::string& wrong) {
    const Sequence shortest = shorten(testbed, sequence, wrong);
    std::ostringstream out;
    out << "seed " << sequence.seed << ": " << wrong << "\n";
    writeCommand(out, sequence.seed);
    out << "shortened to\n" << shortest << "what happens in it\n";
    kdSetLogSinkKOR(&writeLog, &out);
    testbed.run(shortest, &out);
    kdSetLogSinkKOR(&ignoreLog, nullptr);
    return out.str();
}

}  // namespace

std::string run(Testbed& testbed, const Range& range) {
#ifdef LIFECYCLE_TELLS_SEED_AT_DEATH
    __sanitizer_set_death_callback(&tellSeed);
#endif
    std::signal(SIGABRT, &onAbort);
    kdSetLogSinkKOR(&ignoreLog, nullptr);
    std::string found;
    for (std::uint64_t i = 0; i < range.count && found.empty(); ++i) {
        seedThatRuns = range.first + i;
        const Sequence sequence = makeSequence(seedThatRuns);
        const std::string wrong = testbed.run(sequence);
        if (!wrong.empty()) {
            found = report(testbed, sequence, wrong);
        }
    }
    kdSetLogSinkKOR(nullptr, nullptr);
    std::signal(SIGABRT, SIG_DFL);
    return found;
}

}  // namespace Lifecycle
