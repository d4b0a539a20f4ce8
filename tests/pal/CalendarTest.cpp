#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <limits>
#include <string>

#include "pal/kd_time.h"

namespace {

std::string text(const KDTm* tm) {
    if (tm == nullptr) {
        return "null";
    }
    return std::to_string(tm->tm_year) + "-" + std::to_string(tm->tm_mon) + "-" +
           std::to_string(tm->tm_mday) + " " + std::to_string(tm->tm_hour) + ":" +
           std::to_string(tm->tm_min) + ":" + std::to_string(tm->tm_sec) + " w" +
           std::to_string(tm->tm_wday) + " y" + std::to_string(tm->tm_yday);
}

std::string gmtime(KDtime time) {
    KDTm tm{};
    return text(kdGmtime_r(&time, &tm));
}

std::string localtime(KDtime time) {
    KDTm tm{};
    return text(kdLocaltime_r(&time, &tm));
}

/** Sets the process's time zone for the length of a scope. */
class TimeZone {
  public:
    explicit TimeZone(const char* name) {
        const char* const old = std::getenv("TZ");
        hadOld = old != nullptr;
        before = hadOld ? old : "";
        setenv("TZ", name, 1);
        tzset();
    }
    ~TimeZone() {
        if (hadOld) {
            setenv("TZ", before.c_str(), 1);
        } else {
            unsetenv("TZ");
        }
        tzset();
    }
    TimeZone(const TimeZone&) = delete;
    TimeZone& operator=(const TimeZone&) = delete;

  private:
    bool hadOld;
    std::string before;
};

TEST(Gmtime, SplitsKnownTimes) {
    EXPECT_EQ(gmtime(0), "70-0-1 0:0:0 w4 y0");
    EXPECT_EQ(gmtime(-1), "69-11-31 23:59:59 w3 y364");
    EXPECT_EQ(gmtime(951782400), "100-1-29 0:0:0 w2 y59");
    EXPECT_EQ(gmtime(978307199), "100-11-31 23:59:59 w0 y365");
    EXPECT_EQ(gmtime(4107542400), "200-2-1 0:0:0 w1 y59");
    EXPECT_EQ(gmtime(-62135596801), "-1900-11-31 23:59:59 w0 y365");
}

TEST(Gmtime, AgreesWithTheCLibrary) {
    for (KDtime time = -200000000000; time < 400000000000; time += 86400 * 97 + 12345) {
        const auto systemTime = static_cast<std::time_t>(time);
        if (systemTime != time) {
            continue;
        }
        std::tm tm{};
        ASSERT_NE(gmtime_r(&systemTime, &tm), nullptr);
        const KDTm expected{tm.tm_sec, tm.tm_min,  tm.tm_hour, tm.tm_mday,
                            tm.tm_mon, tm.tm_year, tm.tm_wday, tm.tm_yday};
        ASSERT_EQ(gmtime(time), text(&expected)) << time;
    }
}

TEST(Gmtime, SplitsNanosecondsTakenForSeconds) {
    EXPECT_EQ(gmtime(1000000000000000), "31688808-6-5 1:46:40 w0 y186");
}

TEST(Gmtime, StopsAtTheYearsThatFit) {
    const std::string last = "2147483647-11-31 23:59:59 w3 y364";
    const std::string first = "-2147483648-0-1 0:0:0 w4 y0";
    EXPECT_EQ(gmtime(67768036191676799), last);
    EXPECT_EQ(gmtime(67768036191676800), last);
    EXPECT_EQ(gmtime(1700000000000000000), last);
    EXPECT_EQ(gmtime(std::numeric_limits<KDtime>::max()), last);
    EXPECT_EQ(gmtime(67768036191676798).substr(0, 25), "2147483647-11-31 23:59:58");
    EXPECT_EQ(gmtime(-67768040609740800), first);
    EXPECT_EQ(gmtime(-67768040609740801), first);
    EXPECT_EQ(gmtime(std::numeric_limits<KDtime>::min()), first);
    EXPECT_EQ(gmtime(-67768040609740799).substr(0, 21), "-2147483648-0-1 0:0:1");
}

TEST(Gmtime, AcceptsNull) {
    KDtime time = 0;
    KDTm tm{};
    EXPECT_EQ(kdGmtime_r(nullptr, &tm), nullptr);
    EXPECT_EQ(kdGmtime_r(&time, nullptr), nullptr);
    EXPECT_EQ(kdGmtime_r(&time, &tm), &tm);
    EXPECT_EQ(kdLocaltime_r(nullptr, &tm), nullptr);
    EXPECT_EQ(kdLocaltime_r(&time, nullptr), nullptr);
    EXPECT_EQ(kdLocaltime_r(&time, &tm), &tm);
}

TEST(Localtime, UsesTheProcessTimeZone) {
    const TimeZone zone("XYZ-5:30");
    EXPECT_EQ(localtime(0), "70-0-1 5:30:0 w4 y0");
    EXPECT_EQ(localtime(-20000), "69-11-31 23:56:40 w3 y364");
}

TEST(Localtime, AcceptsEveryValue) {
    const TimeZone zone("XYZ-5:30");
    EXPECT_EQ(localtime(std::numeric_limits<KDtime>::max()),
              gmtime(std::numeric_limits<KDtime>::max()));
    EXPECT_EQ(localtime(std::numeric_limits<KDtime>::min()),
              gmtime(std::numeric_limits<KDtime>::min()));
}

}  // namespace
