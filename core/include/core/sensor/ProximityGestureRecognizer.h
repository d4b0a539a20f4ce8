/**
 * @file
 * Gestures over the proximity sensor.
 */
#pragma once

#include <boost/enable_shared_from_this.hpp>
#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "core/Export.h"
#include "core/sensor/GesturePattern.h"
#include "core/sensor/ProximitySource.h"
#include "core/util/Timer.h"

namespace Sensor {

/**
 * Finds gestures in the near and far samples of a proximity sensor; see `GesturePattern` for how a
 * gesture is described. Every gesture is looked for on its own: one movement may be several.
 *
 * Owned by shared pointer. All operations take the event lock and may be called on any thread and
 * from inside the callback; none blocks. Time is the platform clock's.
 */
class KORVEL_CORE_API ProximityGestureRecognizer
    : public boost::enable_shared_from_this<ProximityGestureRecognizer> {
  public:
    /** Told of a recognised gesture by its name, under the event lock. Must not block or throw. */
    using Callback = std::function<void(const std::string& gesture)>;

    /** Uses a new source of the platform's kind. */
    ProximityGestureRecognizer();
    /** @param sensor null where there is none */
    explicit ProximityGestureRecognizer(boost::shared_ptr<ProximitySource> sensor);
    ProximityGestureRecognizer(const ProximityGestureRecognizer&) = delete;
    ProximityGestureRecognizer& operator=(const ProximityGestureRecognizer&) = delete;
    ~ProximityGestureRecognizer();

    /** Replaces the callback; an empty one means nobody is told. */
    void setCallback(Callback callback);

    /**
     * Begins to listen to the sensor, with nothing seen so far. Does nothing while it listens.
     * @return false, and a line in the log, when there is no sensor
     */
    bool start();

    /** Ends it; no gesture is reported afterwards. */
    void stop();

    /**
     * Adds a gesture, or replaces the one of that name; counts from the next sample on.
     * @param name    what the callback is told; not empty
     * @param pattern its spans; see `GesturePattern`
     * @return empty when it was added; else, in plain words, why it was refused (logged as well)
     */
    std::string addGesture(const std::string& name, const std::string& pattern);

  private:
    struct Gesture {
        std::string name;
        GesturePattern pattern;
        bool reported;  // with the span that goes on
    };

    void onSample(bool isNear);
    void endSpan();
    void reportCompleted();
    void reportHeld();
    void report(const std::vector<std::string>& names);
    int64_t getSpanMs() const;

    const boost::shared_ptr<ProximitySource> source;
    Callback target;
    std::vector<Gesture> gestures;
    bool listening = false;
    unsigned stopCount = 0;

    std::vector<ProximitySpan> history;  // spans that have ended, oldest first
    bool seen = false;                   // whether a span goes on
    bool near = false;
    int64_t since = 0;
    Util::Timer timer;
};

}  // namespace Sensor
