#include <gtest/gtest.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <future>
#include <memory>
#include <thread>

#include "pal/kd.h"

namespace {

constexpr KDint64 MS = 1000000;

// Waits on a worker until the event thread is being stopped, then calls everything once more. The
// process cannot end before.
void callEverythingAfterTheStop(void* begun) {
    static_cast<std::promise<void>*>(begun)->set_value();
    while (kdDrainEventsKOR() == 0) {
        std::this_thread::yield();
    }
    kdPostKOR([](void*) { kdLogMessage("posted function ran after the stop"); }, nullptr);
    KDTimer* const timer = kdSetTimer(1, KD_TIMER_PERIODIC_AVERAGE, nullptr);
    const KDint cancelled = kdCancelTimer(timer);
    KDWork* const work =
        kdQueueWorkKOR([](void*) { kdLogMessage("work ran after the stop"); }, nullptr, nullptr);
    kdCancelWorkKOR(work, [](void*) { kdLogMessage("released after the stop"); });
    kdUseManualClockKOR(0);
    kdAdvanceClockKOR(10);
    kdUseRealClockKOR();
    kdEventLockKOR();
    kdEventUnlockKOR();
    KDFile* const file = kdFopen("/dev/null", "rb");
    const KDint closed = kdFclose(file);
    kdLogFormatMessage("after the stop: drained %d cancelled %d closed %d", kdDrainEventsKOR(),
                       cancelled, closed);
}

/** Each test ends a process of its own; the sanitizers check it to its last moment. */
class ProcessEndDeathTest : public ::testing::Test {
  protected:
    void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }

    template <typename Function>
    static void endProcess(Function before) {
        before();
        std::exit(0);
    }
};

const ::testing::ExitedWithCode CLEANLY(0);

void startEventThread() {
    kdPostKOR([](void*) {}, nullptr);
    kdDrainEventsKOR();
}

TEST_F(ProcessEndDeathTest, WithoutAnEventThread) {
    EXPECT_EXIT(endProcess([] { kdGetTimeUST(); }), CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, WithTimersAndPostsWaiting) {
    EXPECT_EXIT(endProcess([] {
                    startEventThread();
                    kdSetTimer(1, KD_TIMER_PERIODIC_AVERAGE, nullptr);
                    kdSetTimer(3600000 * MS, KD_TIMER_ONESHOT, nullptr);
                    for (int i = 0; i < 1000; ++i) {
                        kdPostKOR([](void*) {}, nullptr);
                    }
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, LaterCallsAreHarmless) {
    EXPECT_EXIT(endProcess([] {
                    static std::promise<void> begun;
                    kdQueueWorkKOR(
                        &callEverythingAfterTheStop,
                        [](void*) { kdLogMessage("completed after the stop"); }, &begun);
                    begun.get_future().wait();
                }),
                CLEANLY, "^after the stop: drained -1 cancelled 0 closed 0\n$");
}

// The second work is given back while the first one's release holds the event thread up until the
// end. All workers are busy, so that neither begins.
TEST_F(ProcessEndDeathTest, BetweenTheCancellingOfWorkAndItsEnd) {
    EXPECT_EXIT(endProcess([] {
                    constexpr int WORKERS = 4;
                    static std::atomic<int> busy{0};
                    const auto keepBusy = [](void*) {
                        ++busy;
                        while (kdEventsHaveEndedKOR() == 0) {
                            std::this_thread::yield();
                        }
                    };
                    for (int i = 0; i < WORKERS; ++i) {
                        kdQueueWorkKOR(keepBusy, nullptr, nullptr);
                    }
                    while (busy < WORKERS) {
                        std::this_thread::yield();
                    }
                    const auto nothing = [](void*) {};
                    static KDWork* const first = kdQueueWorkKOR(nothing, nullptr, nullptr);
                    static KDWork* const second = kdQueueWorkKOR(nothing, nullptr, nullptr);
                    static std::promise<void> cancelled;
                    const auto cancel = [](void*) {
                        const auto awaitEnd = [](void*) {
                            cancelled.set_value();
                            while (kdEventsHaveEndedKOR() == 0) {
                                std::this_thread::yield();
                            }
                        };
                        kdCancelWorkKOR(first, awaitEnd);
                        kdCancelWorkKOR(second,
                                        [](void*) { kdLogMessage("released after the end"); });
                    };
                    kdPostKOR(cancel, nullptr);
                    cancelled.get_future().wait();
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, WithTheEventLockHeld) {
    EXPECT_EXIT(endProcess([] {
                    startEventThread();
                    kdEventLockKOR();
                    kdEventLockKOR();
                    kdPostKOR([](void*) { kdLogMessage("ran all the same"); }, nullptr);
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, FromACallback) {
    EXPECT_EXIT(
        {
            kdPostKOR([](void*) { std::exit(0); }, nullptr);
            std::promise<void>().get_future().wait();
        },
        CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, WhileOtherThreadsGoOnCalling) {
    EXPECT_EXIT(endProcess([] {
                    for (int i = 0; i < 3; ++i) {
                        const auto begun = std::make_shared<std::promise<void>>();
                        std::thread([begun] {
                            begun->set_value();
                            for (;;) {
                                kdPostKOR([](void*) {}, nullptr);
                                kdCancelTimer(kdSetTimer(1, KD_TIMER_ONESHOT, nullptr));
                                kdCancelWorkKOR(kdQueueWorkKOR([](void*) {}, nullptr, nullptr),
                                                nullptr);
                                kdDrainEventsKOR();
                            }
                        }).detach();
                        begun->get_future().wait();
                    }
                    startEventThread();
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, WithWorkQueuedAndRunning) {
    EXPECT_EXIT(endProcess([] {
                    for (int i = 0; i < 64; ++i) {
                        kdQueueWorkKOR([](void* user) { free(user); },
                                       [](void*) { kdHoldsEventLockKOR(); }, malloc(10));
                    }
                    startEventThread();
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, LosesNothingThatIsPostedTooLate) {
    EXPECT_EXIT(endProcess([] {
                    startEventThread();
                    // Handlers run in the reverse order, this one after the end of deliveries.
                    static const struct Late {
                        Late() = default;
                        ~Late() {
                            kdPostKOR([](void* user) { free(user); }, malloc(10));
                        }
                        Late(const Late&) = delete;
                        Late& operator=(const Late&) = delete;
                    } late;
                    kdEndEventsFirstKOR();
                }),
                CLEANLY, "^$");
}

/** Says when its end comes. */
class Witness {
  public:
    Witness() = default;
    ~Witness() { kdLogFormatMessage("witness: ended %d", kdEventsHaveEndedKOR()); }
    Witness(const Witness&) = delete;
    Witness& operator=(const Witness&) = delete;
};

TEST_F(ProcessEndDeathTest, EndsDeliveriesBeforeWhatWasThereWhenTheyBegan) {
    EXPECT_EXIT(endProcess([] {
                    static const Witness witness;
                    startEventThread();
                }),
                CLEANLY, "^witness: ended 1\n$");
}

TEST_F(ProcessEndDeathTest, EndsDeliveriesBeforeLaterThingsOnlyWhenAsked) {
    EXPECT_EXIT(endProcess([] {
                    startEventThread();
                    static const Witness witness;
                }),
                CLEANLY, "^witness: ended 0\n$");
    EXPECT_EXIT(endProcess([] {
                    startEventThread();
                    static const Witness witness;
                    kdEndEventsFirstKOR();
                    kdLogFormatMessage("running: ended %d", kdEventsHaveEndedKOR());
                }),
                CLEANLY, "^running: ended 0\nwitness: ended 1\n$");
}

TEST_F(ProcessEndDeathTest, EndsDeliveriesWhileWorkRuns) {
    EXPECT_EXIT(endProcess([] {
                    static std::promise<void> begun;
                    static auto* const finished = new std::promise<void>;
                    static auto* const waiting = new std::future<void>(finished->get_future());
                    static const struct Opener {
                        Opener() = default;
                        // After the end of deliveries, which must not have waited for the work.
                        ~Opener() { finished->set_value(); }
                        Opener(const Opener&) = delete;
                        Opener& operator=(const Opener&) = delete;
                    } opener;
                    kdQueueWorkKOR(
                        [](void*) {
                            begun.set_value();
                            waiting->wait();
                        },
                        nullptr, nullptr);
                    begun.get_future().wait();
                }),
                CLEANLY, "^$");
}

TEST_F(ProcessEndDeathTest, DoesNotWaitForEverForABlockedCallback) {
    EXPECT_EXIT(endProcess([] {
                    static const Witness witness;
                    static std::promise<void> begun;
                    kdPostKOR(
                        [](void*) {
                            begun.set_value();
                            std::promise<void>().get_future().wait();
                        },
                        nullptr);
                    begun.get_future().wait();
                }),
                CLEANLY,
                "^PAL: the event thread is blocked and was left behind\nwitness: ended -1\n$");
}

}  // namespace
