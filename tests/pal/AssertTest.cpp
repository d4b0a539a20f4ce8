#include "pal/kd_assert.h"

#include <gmock/gmock.h>

#include "support/AssertCapture.h"

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;

namespace {

TEST(Assertion, ReachesTheInstalledHandlerAndGoesOn) {
    const AssertCapture asserts;
    kdHandleAssertion("a == b", "util/Bundle", 12);
    kdHandleAssertion(nullptr, nullptr, -1);
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"a == b", "util/Bundle", 12}, AssertReport{"", "", -1}));
}

TEST(Assertion, LosesTheExtensionOfItsFile) {
    const AssertCapture asserts;
    kdHandleAssertionInFileKOR("x", "util/Bundle.cpp", 1);
    kdHandleAssertionInFileKOR("x", "a.b/c", 2);
    kdHandleAssertionInFileKOR("x", "a.b/c.d.hpp", 3);
    kdHandleAssertionInFileKOR("x", nullptr, 4);
    EXPECT_THAT(asserts.reports(),
                ElementsAre(AssertReport{"x", "util/Bundle", 1}, AssertReport{"x", "a.b/c", 2},
                            AssertReport{"x", "a.b/c.d", 3}, AssertReport{"x", "", 4}));
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

TEST(AssertionDeathTest, LogsAndAbortsByDefault) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(kdHandleAssertion("a == b", "util/Bundle", 12),
                 "assertion failed: a == b \\(util/Bundle:12\\)");
}

}  // namespace
