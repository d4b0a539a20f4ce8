#include "core/util/Singleton.h"

#include <gmock/gmock.h>

#include <cstdlib>
#include <future>
#include <string>
#include <thread>
#include <vector>

#include "pal/kd.h"

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using Util::SingletonStorage;

namespace {

std::vector<std::string>& ended() {
    static std::vector<std::string> names;
    return names;
}

class First : public Util::Singleton<First> {
  public:
    ~First() override { ended().emplace_back("First"); }
    int value = 0;
};

class Second : public Util::Singleton<Second> {
  public:
    Second() { First::instance().value = 2; }
    ~Second() override {
        ended().emplace_back(kdHoldsEventLockKOR() != 0 ? "Second" : "Second without lock");
        First::instance().value = 3;
    }
};

class Singleton : public ::testing::Test {
  protected:
    void SetUp() override {
        SingletonStorage::destroyAll();
        ended().clear();
    }
    void TearDown() override { SingletonStorage::destroyAll(); }
};

TEST_F(Singleton, IsMadeOnceAndKept) {
    First& first = First::instance();
    first.value = 5;
    EXPECT_EQ(&First::instance(), &first);
    EXPECT_EQ(First::instance().value, 5);
}

TEST_F(Singleton, IsMadeOnceForAllThreads) {
    std::vector<First*> seen(4);
    std::vector<std::thread> threads;
    threads.reserve(seen.size());
    for (First*& one : seen) {
        threads.emplace_back([&one] { one = &First::instance(); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_THAT(seen, ::testing::Each(&First::instance()));
}

TEST_F(Singleton, AllEndInReverseOrderUnderTheLockAndAreMadeAnew) {
    First::instance().value = 9;
    Second::instance();
    SingletonStorage::destroyAll();
    EXPECT_THAT(ended(), ElementsAre("Second", "First"));
    EXPECT_EQ(First::instance().value, 0);
}

TEST_F(Singleton, MadeByAnotherOneEndsAfterIt) {
    Second::instance();
    EXPECT_EQ(First::instance().value, 2);
    SingletonStorage::destroyAll();
    EXPECT_THAT(ended(), ElementsAre("Second", "First"));
}

TEST_F(Singleton, CanBeDestroyedAlone) {
    First* const first = &First::instance();
    Second::instance();
    SingletonStorage::destroySingleton(first);
    EXPECT_THAT(ended(), ElementsAre("First"));
    SingletonStorage::destroySingleton(first);
    SingletonStorage::destroySingleton(nullptr);
    EXPECT_THAT(ended(), ElementsAre("First"));
}

TEST_F(Singleton, NothingToDestroyIsFine) {
    SingletonStorage::destroyAll();
    EXPECT_THAT(ended(), IsEmpty());
}

class Logging {
  public:
    explicit Logging(const char* text) : name(text) {}
    ~Logging() { kdLogFormatMessage("%s", name.c_str()); }
    Logging(const Logging&) = delete;
    Logging& operator=(const Logging&) = delete;

    const std::string name;
};

const Logging* earlier = nullptr;

class Speaking : public Util::Singleton<Speaking> {
  public:
    ~Speaking() override {
        kdLogFormatMessage("singleton, before %s", earlier->name.c_str());
        kdCancelTimer(kdSetTimer(1, KD_TIMER_ONESHOT, nullptr));
    }
};

class LastWord : public Util::Singleton<LastWord> {
  public:
    ~LastWord() override { kdLogMessage("later singleton"); }
};

TEST(SingletonDeathTest, EndsWithTheProcessBeforeWhatWasThereWhenItWasMade) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            static const Logging object("static object");
            earlier = &object;
            Speaking::instance();
            LastWord::instance();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0),
        "^later singleton\nsingleton, before static object\nstatic object\n$");
}

class Staying : public Util::Singleton<Staying> {
  public:
    static constexpr bool STAYS_AT_PROCESS_END = true;
    ~Staying() override { kdLogMessage("staying singleton"); }
};

TEST(SingletonDeathTest, StaysAtTheEndOfTheProcessWhereOthersMayPointToIt) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            Staying::instance();
            LastWord::instance();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^later singleton\n$");
}

TEST(SingletonDeathTest, FindsDeliveriesEnded) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    class Asking : public Util::Singleton<Asking> {
      public:
        ~Asking() override { kdLogFormatMessage("ended %d", kdEventsHaveEndedKOR()); }
    };
    EXPECT_EXIT(
        {
            kdPostKOR([](void*) {}, nullptr);
            Asking::instance();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^ended 1\n$");
}

TEST(SingletonDeathTest, IsLeftAloneWhereTheLockIsLostForEver) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            LastWord::instance();
            static std::promise<void> begun;
            kdPostKOR(
                [](void*) {
                    begun.set_value();
                    std::promise<void>().get_future().wait();
                },
                nullptr);
            begun.get_future().wait();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^PAL: the event thread is blocked and was left behind\n$");
}

TEST(SingletonDeathTest, EndsOnceWhenDestroyedBeforeTheProcess) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            LastWord::instance();
            SingletonStorage::destroyAll();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^later singleton\n$");
}

TEST(SingletonDeathTest, MadeAnewEndsWithTheProcess) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            LastWord::instance();
            SingletonStorage::destroyAll();
            LastWord::instance();
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "^later singleton\nlater singleton\n$");
}

}  // namespace
