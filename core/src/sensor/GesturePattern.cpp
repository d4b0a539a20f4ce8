#include "core/sensor/GesturePattern.h"

namespace Sensor {

namespace {

/** Cuts a text at blanks. */
std::vector<std::string> splitAtBlanks(const std::string& text) {
    static const char* const BLANKS = " \t";
    std::vector<std::string> pieces;
    std::size_t begin = text.find_first_not_of(BLANKS);
    while (begin != std::string::npos) {
        const std::size_t end = text.find_first_of(BLANKS, begin);
        pieces.push_back(text.substr(begin, end - begin));
        begin = text.find_first_not_of(BLANKS, end);
    }
    return pieces;
}

std::optional<int64_t> parseMilliseconds(const std::string& digits) {
    static const std::size_t DIGITS_MAX = 5;
    if (digits.empty() || digits.size() > DIGITS_MAX ||
        digits.find_first_not_of("0123456789") != std::string::npos) {
        return std::nullopt;
    }
    int64_t value = 0;
    for (const char digit : digits) {
        value = value * 10 + (digit - '0');
    }
    return value <= GesturePattern::MILLISECONDS_MAX ? std::optional<int64_t>(value) : std::nullopt;
}

std::string quote(const std::string& text) {
    static const std::size_t SHOWN_MAX = 40;
    return '"' + text.substr(0, SHOWN_MAX) + '"';
}

}  // namespace

std::optional<GesturePattern> GesturePattern::parse(const std::string& text, std::string& error) {
    GesturePattern pattern;
    for (const std::string& piece : splitAtBlanks(text)) {
        Span span{};
        error = parseSpan(piece, span);
        if (!error.empty()) {
            return std::nullopt;
        }
        if (!pattern.spans.empty() && pattern.spans.back().isNear == span.isNear) {
            error = quote(piece) + " follows a span of the same kind; near and far take turns";
            return std::nullopt;
        }
        pattern.spans.push_back(span);
        if (pattern.spans.size() > SPANS_MAX) {
            error = "more than " + std::to_string(SPANS_MAX) + " spans";
            return std::nullopt;
        }
    }
    if (pattern.spans.empty()) {
        error = "a pattern needs a span, such as near:50-500";
        return std::nullopt;
    }
    return pattern;
}

std::string GesturePattern::parseSpan(const std::string& text, Span& span) {
    const std::size_t colon = text.find(':');
    const std::size_t dash = text.find('-');
    const std::string kind = text.substr(0, colon);
    if (colon == std::string::npos || (kind != "near" && kind != "far")) {
        return quote(text) + " does not begin with near: or far:";
    }
    if (dash == std::string::npos || dash < colon) {
        return quote(text) + " has no \"-\" between minimum and maximum";
    }
    const std::string maximum = text.substr(dash + 1);
    const std::optional<int64_t> low = parseMilliseconds(text.substr(colon + 1, dash - colon - 1));
    const std::optional<int64_t> high = parseMilliseconds(maximum);
    if (!low || (!high && !maximum.empty())) {
        return quote(text) + " has a length that is not a number of milliseconds from 0 to " +
               std::to_string(MILLISECONDS_MAX);
    }
    if (high && *high < *low) {
        return quote(text) + " has a maximum below its minimum";
    }
    span = {kind == "near", *low, high};
    return {};
}

bool GesturePattern::isCompletedBy(const std::vector<ProximitySpan>& history) const {
    return spans.back().maximumMs && fits(history, spans.size());
}

std::optional<int64_t> GesturePattern::getCompletingLength(
    const std::vector<ProximitySpan>& history, bool isNear) const {
    const Span& last = spans.back();
    if (last.maximumMs || last.isNear != isNear || !fits(history, spans.size() - 1)) {
        return std::nullopt;
    }
    return last.minimumMs;
}

/** Whether the newest spans are the first `count` of the pattern. */
bool GesturePattern::fits(const std::vector<ProximitySpan>& history, std::size_t count) const {
    if (history.size() < count) {
        return false;
    }
    const std::size_t offset = history.size() - count;
    for (std::size_t index = 0; index < count; ++index) {
        const ProximitySpan& seen = history[offset + index];
        const Span& wanted = spans[index];
        if (seen.isNear != wanted.isNear || seen.durationMs < wanted.minimumMs ||
            (wanted.maximumMs && seen.durationMs > *wanted.maximumMs)) {
            return false;
        }
    }
    return true;
}

}  // namespace Sensor
