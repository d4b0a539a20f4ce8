#include "PlatformFixture.h"
#include "platforms/android/jni/PlatformRecognizer.h"

namespace {

using Lifecycle::Saying;
using ::testing::ElementsAre;

const char* const CAUSE = "the device recognizer reported 99";

/** What the device recognizer says about its error. */
class DeviceErrorTest : public Lifecycle::PlatformFixture {
  protected:
    void sayCause() { static_cast<PlatformRecognizer&>(*recognizer).onErrorCause(99, CAUSE); }
};

TEST_F(DeviceErrorTest, IsItsNumberAndItsReason) {
    recognizer->start();
    sayCause();
    EXPECT_EQ(recognizer->getDeviceError(), std::nullopt);
    say(Saying::ERROR);
    EXPECT_EQ(recognizer->getErrorReason(), CAUSE);
    EXPECT_EQ(recognizer->getDeviceError(), 99);
    EXPECT_EQ(recognizer->getErrorStatus(), std::nullopt);
}

TEST_F(DeviceErrorTest, DoesNotCountWhenACancelOvertakesIt) {
    recognizer->start();
    sayCause();
    recognizer->cancel();
    say(Saying::ERROR);
    EXPECT_THAT(events, ElementsAre("ErrorCanceled"));
    EXPECT_EQ(recognizer->getErrorReason(), "the application cancelled");
    EXPECT_EQ(recognizer->getDeviceError(), std::nullopt);
}

}  // namespace
