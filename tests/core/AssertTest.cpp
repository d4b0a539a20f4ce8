#include <gmock/gmock.h>

#include <boost/assert.hpp>
#include <boost/make_shared.hpp>
#include <boost/shared_array.hpp>
#include <boost/shared_ptr.hpp>
#include <stdexcept>

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

TEST(BoostAssertion, EndsTheCallWithAnExceptionWhenTheHandlerReturns) {
    const AssertCapture asserts(AssertCapture::RETURN);
    const boost::shared_ptr<Thing> null;
    try {
        static_cast<void>(null->value);
        FAIL() << "went on with a null pointer";
    } catch (const std::logic_error& failure) {
        EXPECT_STREQ(failure.what(), "cannot go on after assertion \"px != 0\"");
    }
    EXPECT_THROW(boost::assertion_failed_msg("a", "because", "f()", "dir/file.hpp", 9),
                 std::logic_error);
    EXPECT_EQ(asserts.count(), 2u);
}

}  // namespace
