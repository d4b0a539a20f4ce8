#include "pal/kd_assert.h"

#include <gmock/gmock.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "support/AssertCapture.h"
#include "support/LogCapture.h"

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::DefaultAssertionHandler;
using TestSupport::LogCapture;

namespace {

TEST(Assertion, ReachesTheInstalledHandlerAndGoesOn) {
    const AssertCapture asserts;
    kdHandleAssertion("a == b", "util/Bundle", 12);
    kdHandleAssertion(nullptr, nullptr, -1);
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"a == b", "util/Bundle", 12}, AssertReport{"", "", -1}));
}

TEST(Assertion, LosesTheExtensionOfItsFileAndTheWayToTheProject) {
    const AssertCapture asserts;
    kdHandleAssertionInFileKOR("x", "util/Bundle.cpp", 1);
    kdHandleAssertionInFileKOR("x", "a.b/c", 2);
    kdHandleAssertionInFileKOR("x", "a.b/c.d.hpp", 3);
    kdHandleAssertionInFileKOR("x", nullptr, 4);
    kdHandleAssertionInFileKOR("x", "../../util/Bundle.cpp", 5);
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"x", "util/Bundle", 1}, AssertReport{"x", "a.b/c", 2},
                            AssertReport{"x", "a.b/c.d", 3}, AssertReport{"x", "", 4},
                            AssertReport{"x", "util/Bundle", 5}));
}

TEST(Assertion, MacroReportsPlaceAndTellsTheResult) {
    const AssertCapture asserts;
    int two = 2;
    EXPECT_TRUE(KOR_ASSERT(two == 2));
    EXPECT_TRUE(KOR_ASSERT_AT(two == 2, "text", "path", 5));
    EXPECT_THAT(asserts.reports(), IsEmpty());
    EXPECT_FALSE(KOR_ASSERT(two == 3));
    const int line = __LINE__ - 1;
    EXPECT_FALSE(KOR_ASSERT_AT(two == 3, "other text", "util/Other", 77));
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"two == 3", "tests/pal/AssertTest", line},
                            AssertReport{"other text", "util/Other", 77}));
}

TEST(Assertion, HandlerMayThrow) {
    const AssertCapture asserts(AssertCapture::THROW);
    EXPECT_THROW(kdHandleAssertion("gone", "a", 1), TestSupport::AssertionRaised);
}

TEST(Assertion, IsLoggedAndSurvivedByDefault) {
    const DefaultAssertionHandler shipped;
    const LogCapture log;
    kdHandleAssertion("a == b", "tests/default", 12);
    EXPECT_THAT(log.messages(), ElementsAre("assertion failed: a == b (tests/default:12)"));
}

TEST(Assertion, ThatKeepsFailingIsLoggedEverMoreSparsely) {
    const DefaultAssertionHandler shipped;
    const LogCapture log;
    for (int i = 0; i < 12345; ++i) {
        kdHandleAssertion("again", "tests/loop", 1);
    }
    EXPECT_THAT(log.messages(), ElementsAre("assertion failed: again (tests/loop:1)",
                                            "assertion failed: again (tests/loop:1), 10 times",
                                            "assertion failed: again (tests/loop:1), 100 times",
                                            "assertion failed: again (tests/loop:1), 1000 times",
                                            "assertion failed: again (tests/loop:1), 10000 times"));
}

TEST(Assertion, FirstReportOfEachSiteIsLogged) {
    const DefaultAssertionHandler shipped;
    const LogCapture log;
    for (int i = 0; i < 3; ++i) {
        kdHandleAssertion("one", "tests/sites", 1);
        kdHandleAssertion("other", "tests/sites", 1);
        kdHandleAssertion("one", "tests/sites", 2);
        kdHandleAssertion("one", "tests/site", 21);
    }
    EXPECT_THAT(log.messages(), ElementsAre("assertion failed: one (tests/sites:1)",
                                            "assertion failed: other (tests/sites:1)",
                                            "assertion failed: one (tests/sites:2)",
                                            "assertion failed: one (tests/site:21)"));
}

TEST(Assertion, CountRisesWithEachReportWhateverTheHandler) {
    const KDint64 before = kdGetAssertionCountKOR();
    {
        const AssertCapture asserts;
        kdHandleAssertion("counted", "tests/count", 1);
        KOR_ASSERT(before < 0);
    }
    EXPECT_EQ(kdGetAssertionCountKOR(), before + 2);
    {
        const AssertCapture asserts(AssertCapture::THROW);
        EXPECT_THROW(kdHandleAssertion("counted", "tests/count", 1), TestSupport::AssertionRaised);
    }
    EXPECT_EQ(kdGetAssertionCountKOR(), before + 3);
    const DefaultAssertionHandler shipped;
    const LogCapture log;
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([] {
            for (int j = 0; j < 500; ++j) {
                kdHandleAssertion("counted", "tests/threads", 1);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(kdGetAssertionCountKOR(), before + 2003);
    EXPECT_EQ(log.messages().size(), 4u) << "1st, 10th, 100th and 1000th";
}

/** Reports each of many sites once. @return how many of them are logged */
std::size_t countLoggedSites(int sites) {
    const DefaultAssertionHandler shipped;
    const LogCapture log;
    for (int line = 0; line < sites; ++line) {
        kdHandleAssertion("many", "tests/many", line);
    }
    return log.messages().size();
}

// In a process of its own, whose sites are not used up by other tests, nor theirs by this.
TEST(AssertionDeathTest, SitesBeyondABoundShareOneCount) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            const std::size_t logged = countLoggedSites(256 + 5000);
            std::fprintf(stderr, "%zu logged", logged);
            std::_Exit(0);
        },
        ::testing::ExitedWithCode(0), "^260 logged$")
        << "256, and the 1st to 1000th of the rest";
}

TEST(AssertionDeathTest, EndsATestThatDoesNotExpectIt) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(kdHandleAssertion("a == b", "util/Bundle", 12), ::testing::KilledBySignal(SIGABRT),
                "assertion failed: a == b \\(util/Bundle:12\\)");
    EXPECT_EXIT(
        {
            { const AssertCapture asserts; }
            kdHandleAssertion("a == b", "util/Bundle", 12);
        },
        ::testing::KilledBySignal(SIGABRT), "assertion failed: a == b \\(util/Bundle:12\\)");
}

}  // namespace
