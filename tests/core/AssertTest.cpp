#include <gmock/gmock.h>

#include <boost/assert.hpp>
#include <boost/make_shared.hpp>
#include <boost/shared_array.hpp>
#include <boost/shared_ptr.hpp>

#include "support/AssertCapture.h"

using TestSupport::AssertCapture;
using TestSupport::AssertionRaised;

namespace {

struct Thing {
    int value = 1;
};

TEST(BoostAssertion, NullSharedPointerIsReportedWithItsPlace) {
    const AssertCapture asserts(AssertCapture::THROW);
    const boost::shared_ptr<Thing> null;
    EXPECT_THROW(static_cast<void>(null->value), AssertionRaised);
    EXPECT_THROW(static_cast<void>(*null), AssertionRaised);
    ASSERT_EQ(asserts.count(), 2u);
    for (const TestSupport::AssertReport& report : asserts.reports()) {
        EXPECT_EQ(report.condition, "px != 0");
        EXPECT_THAT(report.path, ::testing::EndsWith("boost/smart_ptr/shared_ptr"));
        EXPECT_GT(report.line, 0);
    }
}

TEST(BoostAssertion, LivePointerIsNotReported) {
    const AssertCapture asserts(AssertCapture::THROW);
    const auto thing = boost::make_shared<Thing>();
    EXPECT_EQ(thing->value, 1);
    EXPECT_EQ(asserts.count(), 0u);
}

TEST(BoostAssertion, MessageFormIsReportedTheSameWay) {
    const AssertCapture asserts(AssertCapture::THROW);
    EXPECT_THROW(boost::assertion_failed_msg("a", "because", "f()", "dir/file.hpp", 9),
                 AssertionRaised);
    EXPECT_THAT(asserts.reports(),
                ::testing::ElementsAre(TestSupport::AssertReport{"a", "dir/file", 9}));
}

TEST(BoostAssertionDeathTest, AbortsByDefault) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(static_cast<void>(boost::shared_ptr<Thing>()->value),
                 "assertion failed: px != 0 \\(.*smart_ptr/shared_ptr:[0-9]+\\)");
}

TEST(BoostAssertionDeathTest, AbortsWhenTheHandlerReturns) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(
        {
            const AssertCapture asserts(AssertCapture::RETURN);
            static_cast<void>(boost::shared_ptr<Thing>()->value);
        },
        "cannot go on after assertion \"px != 0\"");
}

}  // namespace
