#include "core/sensor/ProximityGestureRecognizer.h"

#include <algorithm>
#include <optional>
#include <utility>

#include "core/util/EventLock.h"
#include "core/util/Time.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"
#include "pal/kd_time.h"

namespace Sensor {

namespace {

using Util::NS_PER_MS;

}  // namespace

ProximityGestureRecognizer::ProximityGestureRecognizer()
    : ProximityGestureRecognizer(ProximitySource::createSource()) {}

ProximityGestureRecognizer::ProximityGestureRecognizer(boost::shared_ptr<ProximitySource> sensor)
    : source(std::move(sensor)), timer([this] { reportHeld(); }) {}

ProximityGestureRecognizer::~ProximityGestureRecognizer() {
    stop();
}

void ProximityGestureRecognizer::setCallback(Callback callback) {
    const Util::EventLock lock;
    target = std::move(callback);
}

bool ProximityGestureRecognizer::start() {
    const Util::EventLock lock;
    if (listening) {
        return true;
    }
    history.clear();
    seen = false;
    // Set before the source is started, which may tell its state at once.
    listening = true;
    const unsigned stopsBefore = stopCount;
    const bool started = source && source->start([this](bool isNear) { onSample(isNear); });
    if (stopCount != stopsBefore) {
        // The callback has stopped it meanwhile, and may have started it again.
        if (!listening && started) {
            source->stop();
        }
        return started || listening;
    }
    if (!started) {
        listening = false;
        kdLogFormatMessage("ProximityGestureRecognizer: there is no proximity sensor");
    }
    return started;
}

void ProximityGestureRecognizer::stop() {
    const Util::EventLock lock;
    timer.cancel();
    if (listening) {
        listening = false;
        ++stopCount;
        source->stop();
    }
}

std::string ProximityGestureRecognizer::addGesture(const std::string& name,
                                                   const std::string& pattern) {
    const Util::EventLock lock;
    std::string error = name.empty() ? "a gesture needs a name" : "";
    std::optional<GesturePattern> parsed;
    if (error.empty()) {
        parsed = GesturePattern::parse(pattern, error);
    }
    if (!parsed) {
        kdLogFormatMessage("ProximityGestureRecognizer: gesture %s is refused: %s", name.c_str(),
                           error.c_str());
        return error;
    }
    const Gesture gesture{name, *parsed, true};
    const auto known =
        std::find_if(gestures.begin(), gestures.end(),
                     [&name](const Gesture& candidate) { return candidate.name == name; });
    if (known != gestures.end()) {
        *known = gesture;
    } else {
        gestures.push_back(gesture);
    }
    return error;
}

void ProximityGestureRecognizer::onSample(bool isNear) {
    if (!listening || (seen && near == isNear)) {
        return;
    }
    // The callback may drop this object.
    const boost::shared_ptr<ProximityGestureRecognizer> self = weak_from_this().lock();
    const bool hasEnded = seen;
    if (hasEnded) {
        endSpan();
    }
    seen = true;
    near = isNear;
    since = kdGetTimeUST();
    for (Gesture& gesture : gestures) {
        gesture.reported = false;
    }
    const unsigned stopsBefore = stopCount;
    if (hasEnded) {
        reportCompleted();
    }
    if (stopCount == stopsBefore) {
        reportHeld();
    }
}

void ProximityGestureRecognizer::endSpan() {
    history.push_back({near, getSpanMs()});
    if (history.size() > GesturePattern::SPANS_MAX) {
        history.erase(history.begin());
    }
}

int64_t ProximityGestureRecognizer::getSpanMs() const {
    return (kdGetTimeUST() - since) / NS_PER_MS;
}

/** Gestures that the span which has just ended completes. */
void ProximityGestureRecognizer::reportCompleted() {
    std::vector<std::string> names;
    for (const Gesture& gesture : gestures) {
        if (gesture.pattern.isCompletedBy(history)) {
            names.push_back(gesture.name);
        }
    }
    report(names);
}

/** Gestures that the span which goes on has completed by now; waits for the next ones. */
void ProximityGestureRecognizer::reportHeld() {
    const boost::shared_ptr<ProximityGestureRecognizer> self = weak_from_this().lock();
    timer.cancel();
    std::vector<std::string> names;
    std::optional<int64_t> next;
    const int64_t lengthMs = getSpanMs();
    for (Gesture& gesture : gestures) {
        const std::optional<int64_t> wantedMs = gesture.pattern.getCompletingLength(history, near);
        if (!wantedMs || gesture.reported) {
            continue;
        }
        if (lengthMs >= *wantedMs) {
            gesture.reported = true;
            names.push_back(gesture.name);
        } else {
            next = std::min(next.value_or(*wantedMs), *wantedMs);
        }
    }
    if (next) {
        timer.start(KD_TIMER_ONESHOT, since + *next * NS_PER_MS - kdGetTimeUST());
    }
    report(names);
}

void ProximityGestureRecognizer::report(const std::vector<std::string>& names) {
    const unsigned stopsBefore = stopCount;
    for (const std::string& name : names) {
        // Asked each time, because the callback may stop this object, even to start it again, or
        // replace itself.
        const Callback callback = target;
        if (stopCount == stopsBefore && callback) {
            callback(name);
        }
    }
}

}  // namespace Sensor
