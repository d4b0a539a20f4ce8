#include <cstdint>
#include <ctime>
#include <limits>

#include "pal/kd_time.h"

namespace {

constexpr std::int64_t SECONDS_PER_DAY = 86400;
constexpr std::int64_t DAYS_PER_ERA = 146097;  // 400 years
constexpr std::int64_t EPOCH_YEAR = 1970;
constexpr std::int64_t TM_YEAR_BASE = 1900;

std::int64_t floorDivide(std::int64_t value, std::int64_t divisor) {
    return value / divisor - (value % divisor < 0 ? 1 : 0);
}

bool isLeapYear(std::int64_t year) {
    return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

/** Days from 1970-01-01 to the first of January of the year. */
std::int64_t daysToYear(std::int64_t year) {
    const std::int64_t before = year - 1;
    const std::int64_t leapDays =
        floorDivide(before, 4) - floorDivide(before, 100) + floorDivide(before, 400);
    constexpr std::int64_t LEAP_DAYS_TO_1970 = 1969 / 4 - 1969 / 100 + 1969 / 400;
    return (year - EPOCH_YEAR) * 365 + leapDays - LEAP_DAYS_TO_1970;
}

std::int64_t yearOfDay(std::int64_t day) {
    std::int64_t year = EPOCH_YEAR + floorDivide(day * 400, DAYS_PER_ERA);
    while (daysToYear(year) > day) {
        --year;
    }
    while (daysToYear(year + 1) <= day) {
        ++year;
    }
    return year;
}

/** The nearest time whose year fits. */
std::int64_t limitSeconds(std::int64_t seconds) {
    constexpr std::int64_t FIRST_YEAR = std::numeric_limits<KDint>::min() + TM_YEAR_BASE;
    constexpr std::int64_t LAST_YEAR = std::numeric_limits<KDint>::max() + TM_YEAR_BASE;
    const std::int64_t first = daysToYear(FIRST_YEAR) * SECONDS_PER_DAY;
    const std::int64_t last = daysToYear(LAST_YEAR + 1) * SECONDS_PER_DAY - 1;
    return seconds < first ? first : (seconds > last ? last : seconds);
}

void setMonthAndDay(KDTm& tm, std::int64_t year, KDint dayOfYear) {
    const KDint lengths[] = {31, isLeapYear(year) ? 29 : 28, 31, 30, 31, 30, 31, 31, 30, 31, 30,
                             31};
    KDint month = 0;
    while (dayOfYear >= lengths[month]) {
        dayOfYear -= lengths[month];
        ++month;
    }
    tm.tm_mon = month;
    tm.tm_mday = dayOfYear + 1;
}

void splitUtc(std::int64_t seconds, KDTm& tm) {
    const std::int64_t limited = limitSeconds(seconds);
    const std::int64_t day = floorDivide(limited, SECONDS_PER_DAY);
    const auto secondOfDay = static_cast<KDint>(limited - day * SECONDS_PER_DAY);
    const std::int64_t year = yearOfDay(day);
    const std::int64_t weekday = day + 4;  // 1970 began on a Thursday
    tm.tm_sec = secondOfDay % 60;
    tm.tm_min = secondOfDay / 60 % 60;
    tm.tm_hour = secondOfDay / 3600;
    tm.tm_year = static_cast<KDint>(year - TM_YEAR_BASE);
    tm.tm_wday = static_cast<KDint>(weekday - floorDivide(weekday, 7) * 7);
    tm.tm_yday = static_cast<KDint>(day - daysToYear(year));
    setMonthAndDay(tm, year, tm.tm_yday);
}

}  // namespace

KDTm* kdGmtime_r(const KDtime* timep, KDTm* result) {
    if (timep == nullptr || result == nullptr) {
        return nullptr;
    }
    splitUtc(*timep, *result);
    return result;
}

KDTm* kdLocaltime_r(const KDtime* timep, KDTm* result) {
    if (timep == nullptr || result == nullptr) {
        return nullptr;
    }
    const auto time = static_cast<std::time_t>(*timep);
    std::tm local{};
    if (time != *timep || localtime_r(&time, &local) == nullptr) {
        splitUtc(*timep, *result);  // beyond what the system's zone data can tell
        return result;
    }
    *result = {local.tm_sec, local.tm_min,  local.tm_hour, local.tm_mday,
               local.tm_mon, local.tm_year, local.tm_wday, local.tm_yday};
    return result;
}
