#include "talvox/impl/DecisionHistory.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "support/TestSound.h"

namespace {

using Talvox::DecisionHistory;

DecisionHistory makeHistory(const std::string& bits) {
    DecisionHistory history;
    history.resize(bits.size());
    for (const char bit : bits) {
        history.push(bit == '1');
    }
    return history;
}

TEST(DecisionHistory, BeginsEmpty) {
    DecisionHistory history;
    history.push(true);
    EXPECT_EQ(0U, history.size());
    EXPECT_EQ("", history.toString(1000));
    EXPECT_EQ(0U, history.countNewest(10));
}

TEST(DecisionHistory, NewDecisionsPushOutTheOldest) {
    DecisionHistory history;
    history.resize(4);
    EXPECT_EQ("0000", history.toString(1000));
    history.push(true);
    EXPECT_EQ("0001", history.toString(1000));
    history.push(false);
    history.push(true);
    history.push(true);
    EXPECT_EQ("1011", history.toString(1000));
    history.push(false);
    EXPECT_EQ("0110", history.toString(1000));
}

TEST(DecisionHistory, ShowsItsNewestDecisions) {
    DecisionHistory history = makeHistory("0110");
    history.push(true);
    EXPECT_EQ("1101", history.toString(4));
    EXPECT_EQ("101", history.toString(3));
    EXPECT_EQ("1", history.toString(1));
    EXPECT_EQ("", history.toString(0));
}

TEST(DecisionHistory, IsCutAndExtendedAtItsEnd) {
    DecisionHistory history = makeHistory("0110");
    history.push(true);
    ASSERT_EQ("1101", history.toString(1000));
    history.resize(6);
    EXPECT_EQ("110100", history.toString(1000));
    history.resize(2);
    EXPECT_EQ("11", history.toString(1000));
    history.resize(2);
    EXPECT_EQ("11", history.toString(1000));
    history.resize(0);
    EXPECT_EQ("", history.toString(1000));
}

TEST(DecisionHistory, CountsTheNewestOfAnyLengthAtAnyTurn) {
    TestSupport::NoiseSource noise(3);
    for (const std::size_t length : {1U, 5U, 63U, 64U, 65U, 100U, 128U, 200U}) {
        DecisionHistory history;
        history.resize(length);
        std::string model(length, '0');
        for (std::size_t turn = 0; turn < 2 * length + 3; ++turn) {
            const bool decision = noise.next() > 0;
            history.push(decision);
            model = model.substr(1) + (decision ? '1' : '0');
            ASSERT_EQ(model, history.toString(1000));
            for (std::size_t span = 0; span <= length + 2; ++span) {
                const std::size_t begin = length - std::min(span, length);
                ASSERT_EQ(
                    static_cast<std::size_t>(std::count(
                        model.begin() + static_cast<std::ptrdiff_t>(begin), model.end(), '1')),
                    history.countNewest(span))
                    << length << " " << turn << " " << span;
            }
        }
    }
}

TEST(DecisionHistory, CountsWhatIsLeftAfterAChangeOfLength) {
    DecisionHistory history = makeHistory("0110");
    history.push(true);
    history.resize(100);
    EXPECT_EQ(3U, history.countNewest(100));
    EXPECT_EQ(0U, history.countNewest(96));
    history.push(true);
    EXPECT_EQ(3U, history.countNewest(100));
    EXPECT_EQ(1U, history.countNewest(1));
    history.resize(2);
    EXPECT_EQ(1U, history.countNewest(2));
    history.resize(0);
    history.resize(3);
    EXPECT_EQ(0U, history.countNewest(3));
}

}  // namespace
