#include "Control.h"

#include <dlfcn.h>
#include <execinfo.h>
#include <unistd.h>

#include <cstdio>

namespace Torture {

namespace {

template <typename Function>
Function* find(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_DEFAULT, name));
}

/** The functions of the library; null when it is not preloaded. */
struct Library {
    decltype(&tortureArm) arm = find<void(int, long, int, int, const char**)>("tortureArm");
    decltype(&tortureDisarm) disarm = find<void()>("tortureDisarm");
    decltype(&tortureCountCalls) countCalls = find<long(int)>("tortureCountCalls");
    decltype(&tortureFailure) failure = find<const Failure*()>("tortureFailure");
    decltype(&tortureExempt) exempt = find<void(int)>("tortureExempt");
};

const Library& library() {
    static const Library found;
    return found;
}

void exempt(int change) {
    if (isPreloaded()) {
        library().exempt(change);
    }
}

}  // namespace

bool isPreloaded() {
    return library().arm != nullptr;
}

void arm(const Order& order, Report& report) {
    if (isPreloaded()) {
        library().arm(order.kind, order.call, order.onward, order.withStack,
                      &report.failedFunction);
    }
}

void disarm(Report& report) {
    if (!isPreloaded()) {
        return;
    }
    library().disarm();
    for (int kind = 0; kind < KIND_COUNT; ++kind) {
        report.calls[kind] = library().countCalls(kind);
    }
}

Harness::Harness() {
    exempt(1);
}

Harness::~Harness() {
    exempt(-1);
}

InEngine::InEngine() {
    exempt(-1);
}

InEngine::~InEngine() {
    exempt(1);
}

}  // namespace Torture
