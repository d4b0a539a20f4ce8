#include "core/util/ListenerList.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <memory>
#include <string>
#include <utility>

namespace {

class Listener {
  public:
    Listener(std::string& calls, char ownName, std::function<void()> ownReaction = {})
        : log(calls), name(ownName), reaction(std::move(ownReaction)) {}

    void hear() {
        log += name;
        if (reaction) {
            reaction();
        }
    }

  private:
    std::string& log;
    char name;
    std::function<void()> reaction;
};

class ListenerList : public ::testing::Test {
  protected:
    boost::shared_ptr<Listener> make(char name, std::function<void()> reaction = {}) {
        return boost::make_shared<Listener>(calls, name, std::move(reaction));
    }

    std::string notify() {
        calls.clear();
        list.notify([](Listener& listener) { listener.hear(); });
        return calls;
    }

    std::string calls;
    Util::ListenerList<Listener> list;
};

TEST_F(ListenerList, CallsInTheOrderOfAddition) {
    const auto a = make('a');
    const auto b = make('b');
    list.add(b);
    list.add(a);
    EXPECT_EQ(notify(), "ba");
    EXPECT_EQ(notify(), "ba");
}

TEST_F(ListenerList, CallsAListenerAsOftenAsItWasAdded) {
    const auto a = make('a');
    list.add(a);
    list.add(a);
    EXPECT_EQ(notify(), "aa");
    list.remove(a);
    EXPECT_EQ(list.size(), 0u);
    EXPECT_EQ(notify(), "");
}

TEST_F(ListenerList, RemovesOnlyTheListenerThatIsMeant) {
    const auto a = make('a');
    const auto b = make('b');
    list.add(a);
    list.add(b);
    list.remove(a);
    list.remove(make('c'));
    EXPECT_EQ(notify(), "b");
}

TEST_F(ListenerList, HoldsNothingAliveAndForgetsTheExpired) {
    auto a = make('a');
    const auto b = make('b');
    const boost::weak_ptr<Listener> weak(a);
    list.add(a);
    list.add(b);
    a.reset();
    EXPECT_TRUE(weak.expired());
    EXPECT_EQ(list.size(), 2u);
    EXPECT_EQ(notify(), "b");
    EXPECT_EQ(list.size(), 1u);
}

TEST_F(ListenerList, RemovesAnExpiredListener) {
    auto a = make('a');
    const auto b = make('b');
    const boost::weak_ptr<Listener> weak(a);
    list.add(a);
    list.add(b);
    a.reset();
    list.remove(weak);
    EXPECT_EQ(list.size(), 1u);
    EXPECT_EQ(notify(), "b");
}

TEST_F(ListenerList, CallsAnAddedListenerFromTheNextTimeOn) {
    boost::shared_ptr<Listener> late;
    const auto a = make('a', [&] {
        if (!late) {
            late = make('l');
            list.add(late);
        }
    });
    list.add(a);
    EXPECT_EQ(notify(), "a");
    EXPECT_EQ(notify(), "al");
}

TEST_F(ListenerList, SkipsOneThatDiesBeforeItsTurn) {
    boost::shared_ptr<Listener> victim = make('v');
    const auto a = make('a', [&] { victim.reset(); });
    list.add(a);
    list.add(victim);
    EXPECT_EQ(notify(), "a");
}

TEST_F(ListenerList, StillCallsOneThatIsRemovedBeforeItsTurn) {
    const auto removed = make('r');
    const auto a = make('a', [&] { list.remove(removed); });
    list.add(a);
    list.add(removed);
    EXPECT_EQ(notify(), "ar");
    EXPECT_EQ(notify(), "a");
}

TEST_F(ListenerList, LetsAListenerRemoveItself) {
    boost::shared_ptr<Listener> self;
    self = make('s', [&] { list.remove(self); });
    const auto b = make('b');
    list.add(self);
    list.add(b);
    EXPECT_EQ(notify(), "sb");
    EXPECT_EQ(notify(), "b");
}

TEST_F(ListenerList, KeepsAListenerAliveForItsOwnCallOnly) {
    boost::shared_ptr<Listener> self;
    bool aliveInside = false;
    boost::weak_ptr<Listener> weak;
    self = make('s', [&] {
        self.reset();
        aliveInside = !weak.expired();
    });
    weak = self;
    bool aliveLater = true;
    const auto b = make('b', [&] { aliveLater = !weak.expired(); });
    list.add(weak);
    list.add(b);
    EXPECT_EQ(notify(), "sb");
    EXPECT_TRUE(aliveInside);
    EXPECT_FALSE(aliveLater);
}

TEST_F(ListenerList, MayBeDestroyedByAListener) {
    auto own = std::make_unique<Util::ListenerList<Listener>>();
    const auto a = make('a', [&] { own.reset(); });
    const auto b = make('b');
    own->add(a);
    own->add(b);
    own->notify([](Listener& listener) { listener.hear(); });
    EXPECT_EQ(calls, "ab");
    EXPECT_EQ(own, nullptr);
}

TEST_F(ListenerList, MayNotifyAgainFromInside) {
    int depth = 0;
    const auto a = make('a', [&] {
        if (++depth == 1) {
            list.notify([](Listener& listener) { listener.hear(); });
        }
    });
    const auto b = make('b');
    list.add(a);
    list.add(b);
    EXPECT_EQ(notify(), "aabb");
}

}  // namespace
