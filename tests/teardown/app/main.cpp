// An application that ends in the worst moment. Prints how long its calls took, and when the end of
// the process began.
//
// usage: teardown_app end=release|cancel|destroy|return|exit [repeat=N] [go=FIFO] [OPTION...]
#include <time.h>

#include <boost/make_shared.hpp>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include "Journal.h"
#include "Scene.h"
#include "core/util/Singleton.h"
#include "pal/kd.h"
#include "support/AbortOnAssertion.h"

namespace TearDown {

// Visible to others, so that they are really kept. Their objects outlive the static ones.
boost::shared_ptr<Talvox::Recognizer>* neverReleased = nullptr;
boost::shared_ptr<JournalListener>* neverReleasedListener = nullptr;

}  // namespace TearDown

namespace {

using TearDown::Journal;
using TearDown::JournalListener;
using TearDown::Options;
using TearDown::Scene;

// As applications have them: made before the engine, destroyed after all that it made later.
Journal journal;
boost::shared_ptr<JournalListener> listener;
boost::shared_ptr<Talvox::Recognizer> session;

/** Keeps the event thread busy to its last moment. */
void postForEver(void* /*user*/) {
    journal.add("posted");
    kdPostKOR(&postForEver, nullptr);
}

template <typename Call>
void measure(Call call) {
    const auto begin = std::chrono::steady_clock::now();
    call();
    const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - begin;
    std::printf("took %.3f\n", took.count());
}

void makeListener() {
    listener = boost::make_shared<JournalListener>(journal);
}

void waitForGo(const Options& options) {
    if (options.has("go")) {
        std::printf("ready\n");
        std::fflush(stdout);
        // Opens when somebody opens the other side.
        const std::ifstream go(options.get("go"));
    }
}

bool endCalls(const Options& options, Scene& scene) {
    const std::string end = options.get("end");
    for (int left = std::atoi(options.get("repeat").c_str()); left > 0; --left) {
        makeListener();
        scene.prepare(listener);
        session = scene.takeSession();
        waitForGo(options);
        if (end == "cancel") {
            measure([] { session->cancel(); });
        } else {
            listener->expectNothing();
        }
        if (end == "release") {
            measure([] { session.reset(); });
        } else if (end == "destroy") {
            session.reset();
            measure([] { Util::SingletonStorage::destroyAll(); });
        }
        listener->expectNothing();
        scene.cleanUp();
        kdDrainEventsKOR();
        kdAdvanceClockKOR(60LL * 1000 * 1000 * 1000);
        kdDrainEventsKOR();
        if (listener->countUnexpected() > 0) {
            std::printf("too late: %d events\n", listener->countUnexpected());
            return false;
        }
        session.reset();
    }
    return true;
}

void announceEnd() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    std::printf("ends %lld\n", static_cast<long long>(now.tv_sec) * 1000000000LL + now.tv_nsec);
    std::fflush(stdout);
}

int endProcess(const Options& options, Scene& scene) {
    makeListener();
    scene.prepare(listener);
    session = scene.takeSession();
    if (options.has("leaked")) {
        TearDown::neverReleased = new boost::shared_ptr<Talvox::Recognizer>(std::move(session));
        TearDown::neverReleasedListener = new boost::shared_ptr<JournalListener>(listener);
    }
    postForEver(nullptr);
    waitForGo(options);
    announceEnd();
    if (options.get("end") == "exit") {
        std::exit(0);
    }
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    TestSupport::abortOnAssertion();
    static const Options options(argc, argv);
    // What the session refers to while it runs goes with the process.
    static auto& scene = *new Scene(options);
    const std::string end = options.get("end");
    if (end == "return" || end == "exit") {
        return endProcess(options, scene);
    }
    return endCalls(options, scene) ? 0 : 1;
}
