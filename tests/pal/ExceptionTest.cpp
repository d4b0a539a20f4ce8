// Exceptions that leave a callback: reported once, and the next callback runs.
#include <gmock/gmock.h>

#include <future>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include "Ticker.h"
#include "pal/kd.h"
#include "support/LogCapture.h"

namespace {

using ::testing::ElementsAre;

/** Registers for exceptions and keeps what they say. Under the event lock, apart from `take`. */
class Reports {
  public:
    Reports() { kdInstallCallback(&Reports::add, KD_EVENT_EXCEPTION_KOR, this); }
    ~Reports() { kdInstallCallback(nullptr, KD_EVENT_EXCEPTION_KOR, this); }
    Reports(const Reports&) = delete;
    Reports& operator=(const Reports&) = delete;

    std::vector<std::string> take() {
        kdDrainEventsKOR();
        kdEventLockKOR();
        std::vector<std::string> taken;
        taken.swap(texts);
        kdEventUnlockKOR();
        return taken;
    }

  private:
    static void add(const KDEvent* event) {
        static_cast<Reports*>(event->userptr)->texts.emplace_back(event->text);
        EXPECT_EQ(kdHoldsEventLockKOR(), 1);
    }

    std::vector<std::string> texts;
};

[[noreturn]] void throwError(void* /*user*/) {
    throw std::runtime_error("broken");
}

[[noreturn]] void throwNumber(void* /*user*/) {
    throw 1;
}

void addOne(void* count) {
    ++*static_cast<int*>(count);
}

TEST(Exceptions, OfAPostAreReportedAndTheNextPostRuns) {
    const TestSupport::LogCapture log;
    Reports reports;
    int count = 0;
    EXPECT_EQ(kdPostKOR(&throwError, nullptr), 0);
    EXPECT_EQ(kdPostKOR(&throwNumber, nullptr), 0);
    EXPECT_EQ(kdPostKOR(&addOne, &count), 0);
    EXPECT_THAT(reports.take(), ElementsAre("broken", "of an unknown type"));
    EXPECT_EQ(count, 1);
    EXPECT_THAT(log.messages(),
                ElementsAre("PAL: an exception ended a callback: broken",
                            "PAL: an exception ended a callback: of an unknown type"));
}

TEST(Exceptions, OfATimerAreReportedAndItGoesOn) {
    const TestSupport::LogCapture log;
    Reports reports;
    kdUseManualClockKOR(0);
    {
        PalTest::Ticker ticker([](const KDEvent&) { throwError(nullptr); });
        ticker.start(10, KD_TIMER_PERIODIC_AVERAGE);
        kdAdvanceClockKOR(20);
    }
    kdUseRealClockKOR();
    EXPECT_THAT(reports.take(), ElementsAre("broken", "broken"));
}

TEST(Exceptions, OfWorkAreReportedAndItCompletes) {
    const TestSupport::LogCapture log;
    Reports reports;
    std::promise<void> completed;
    kdQueueWorkKOR(
        &throwError,
        [](void* user) {
            static_cast<std::promise<void>*>(user)->set_value();
            throw std::bad_alloc();
        },
        &completed);
    completed.get_future().wait();
    const std::vector<std::string> all = reports.take();
    EXPECT_THAT(all, ElementsAre("broken", std::bad_alloc().what()));
}

TEST(Exceptions, ReachEveryRegistrationAlsoWhereOneRemovesAnother) {
    const TestSupport::LogCapture log;
    static int calls = 0;
    calls = 0;
    // Each key's value leads to the other one.
    int keys[] = {1, -1};
    const auto removeBoth = [](const KDEvent* event) {
        ++calls;
        int* const own = static_cast<int*>(event->userptr);
        kdInstallCallback(nullptr, KD_EVENT_EXCEPTION_KOR, own);
        kdInstallCallback(nullptr, KD_EVENT_EXCEPTION_KOR, own + *own);
    };
    kdInstallCallback(removeBoth, KD_EVENT_EXCEPTION_KOR, &keys[0]);
    kdInstallCallback(removeBoth, KD_EVENT_EXCEPTION_KOR, &keys[1]);
    kdReportExceptionKOR("broken");
    EXPECT_EQ(calls, 1);
}

TEST(Exceptions, OfTheHandlerItselfAreOnlyLogged) {
    const TestSupport::LogCapture log;
    int key = 0;
    kdInstallCallback([](const KDEvent*) { throw std::runtime_error("again"); },
                      KD_EVENT_EXCEPTION_KOR, &key);
    kdReportExceptionKOR("broken");
    kdInstallCallback(nullptr, KD_EVENT_EXCEPTION_KOR, &key);
    EXPECT_THAT(log.messages(), ElementsAre("PAL: an exception ended a callback: broken",
                                            "PAL: so did its report: again"));
}

TEST(Exceptions, OfTheLogSinkLeaveTheMessageOnStandardError) {
    kdSetLogSinkKOR([](const char*, void*) { throw std::bad_alloc(); }, nullptr);
    ::testing::internal::CaptureStderr();
    kdLogMessage("kept");
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "kept\n");
    kdSetLogSinkKOR(nullptr, nullptr);
}

}  // namespace
