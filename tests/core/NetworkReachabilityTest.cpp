#include <gtest/gtest.h>

#include <algorithm>

#include "core/network/NetworkInterfaces.h"
#include "core/network/NetworkManager.h"

using Network::judgeReachability;
using Network::listNetworkInterfaces;
using Network::NetworkInterface;
using Network::NetworkManager;

namespace {

const NetworkInterface LOOPBACK{"lo", true, true};

TEST(NetworkReachability, IsNoneWithoutAUsableInterface) {
    EXPECT_EQ(0, judgeReachability({}));
    EXPECT_EQ(0, judgeReachability({{"lo", true, false}, {"eth0", false, false}}));
}

TEST(NetworkReachability, CountsALoopbackOnlyHostAsReachable) {
    EXPECT_EQ(1, judgeReachability({LOOPBACK}));
    EXPECT_EQ(1, judgeReachability({LOOPBACK, {"eth0", false, false}, {"wwan0", false, false}}));
}

TEST(NetworkReachability, IsFreeOverWireAndWifi) {
    EXPECT_EQ(1, judgeReachability({LOOPBACK, {"eth0", false, true}}));
    EXPECT_EQ(1, judgeReachability({{"wlp2s0", false, true}}));
    EXPECT_EQ(1, judgeReachability({{"rmnet0", false, true}, {"wlan0", false, true}}));
}

TEST(NetworkReachability, IsMeteredOverMobileLinksAlone) {
    for (const char* const name : {"wwan0", "ppp0", "rmnet_data0", "ccmni1"}) {
        EXPECT_EQ(2, judgeReachability({LOOPBACK, {name, false, true}, {"wlan0", false, false}}))
            << name;
    }
}

TEST(NetworkReachability, KnowsTheInterfacesOfThisHost) {
    const auto interfaces = listNetworkInterfaces();
    ASSERT_TRUE(interfaces);
    EXPECT_TRUE(std::any_of(interfaces->begin(), interfaces->end(),
                            [](const NetworkInterface& each) { return each.loopback; }));
    EXPECT_EQ(judgeReachability(*interfaces), NetworkManager::getInstance().getReachability());
}

TEST(NetworkReachability, TakesTheEmbeddersWord) {
    NetworkManager& manager = NetworkManager::getInstance();
    const int own = manager.getReachability();
    for (const int word : {0, 1, 2, 7}) {
        manager.overrideReachability(word);
        EXPECT_EQ(word, manager.getReachability());
    }
    manager.overrideReachability(-1);
    EXPECT_EQ(own, manager.getReachability());
}

}  // namespace
