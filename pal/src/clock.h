#pragma once

#include <cstdint>

namespace korvel_pal {

constexpr std::int64_t NS_PER_SECOND = 1000000000;

/** The larger of the representable values where the sum overflows; `delta` is not negative. */
constexpr std::int64_t addTime(std::int64_t time, std::int64_t delta) {
    return time > INT64_MAX - delta ? INT64_MAX : time + delta;
}

/** Which clock is in use, and the time that the hand-driven one shows. */
class Clock {
  public:
    static std::int64_t now();
    static bool isManual();
    static void useManual(std::int64_t now);
    static void useReal();
};

}  // namespace korvel_pal
