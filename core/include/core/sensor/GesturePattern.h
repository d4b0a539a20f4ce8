/**
 * @file
 * How a proximity gesture is described.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "core/Export.h"

namespace Sensor {

/** A time during which the sensor said the same. */
struct ProximitySpan {
    /** Whether something was near. */
    bool isNear;
    /** How long. */
    int64_t durationMs;
};

/**
 * The spans of a gesture, from its first to its last.
 *
 *     pattern = span { blanks span }              1 to 16 spans, near and far in turn
 *     span    = ( "near" | "far" ) ":" minimum "-" [ maximum ]
 *     minimum, maximum = milliseconds, 0 to 60000, minimum <= maximum
 *
 * A span fits when it lasts at least the minimum and at most the maximum. Without a maximum it may
 * last for ever. A gesture whose last span has a maximum is complete when that span ends; one whose
 * last span has none, as soon as the minimum is reached.
 *
 * A hand that waves once: "near:50-500"; twice: "near:50-500 far:50-500 near:50-500"; that covers
 * the sensor for a second: "near:1000-"; once and not twice: "near:50-500 far:600-".
 */
class KORVEL_CORE_API GesturePattern {
  public:
    /** The most spans, and the longest time, in a pattern. */
    static constexpr std::size_t SPANS_MAX = 16;
    static constexpr int64_t MILLISECONDS_MAX = 60000;

    /**
     * @param[out] error why the text is refused, in plain words
     * @return nothing when it is refused
     */
    static std::optional<GesturePattern> parse(const std::string& text, std::string& error);

    /** How many spans the pattern has. */
    std::size_t getSpanCount() const { return spans.size(); }

    /** Whether the gesture is complete with the end of the last span of `history`. */
    bool isCompletedBy(const std::vector<ProximitySpan>& history) const;

    /**
     * When the gesture is complete with a span that goes on.
     * @param history the spans that have ended before it
     * @param isNear  what it is
     * @return the length in milliseconds that completes the gesture; nothing when none does
     */
    std::optional<int64_t> getCompletingLength(const std::vector<ProximitySpan>& history,
                                               bool isNear) const;

  private:
    struct Span {
        bool isNear;
        int64_t minimumMs;
        std::optional<int64_t> maximumMs;
    };

    static std::string parseSpan(const std::string& text, Span& span);
    bool fits(const std::vector<ProximitySpan>& history, std::size_t count) const;

    std::vector<Span> spans;
};

}  // namespace Sensor
