#include <curl/curl.h>
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <ifaddrs.h>
#include <sys/socket.h>

#include <atomic>
#include <cerrno>

#include "NetworkFixture.h"
#include "core/network/NetworkInterfaces.h"

namespace {

std::atomic<bool> scarce{false};
std::atomic<int> wakeUpsToLose{0};

/** While it lives, the network layer gets no further descriptors; open ones go on working. */
class NoDescriptors {
  public:
    NoDescriptors() { scarce = true; }
    ~NoDescriptors() { scarce = false; }
    NoDescriptors(const NoDescriptors&) = delete;
    NoDescriptors& operator=(const NoDescriptors&) = delete;
};

int refuse() {
    errno = EMFILE;
    return -1;
}

template <typename Function>
Function* next(const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace

// These stand before the functions of the system and of libcurl.
#pragma GCC visibility push(default)
extern "C" {

int socketpair(int domain, int type, int protocol, int ends[2]) noexcept {
    return scarce ? refuse()
                  : next<int(int, int, int, int*)>("socketpair")(domain, type, protocol, ends);
}

int socket(int domain, int type, int protocol) noexcept {
    return scarce ? refuse() : next<int(int, int, int)>("socket")(domain, type, protocol);
}

int getifaddrs(ifaddrs** list) noexcept {
    return scarce ? refuse() : next<int(ifaddrs**)>("getifaddrs")(list);
}

CURLMcode curl_multi_wakeup(CURLM* multi) {
    if (wakeUpsToLose > 0) {
        --wakeUpsToLose;
        return CURLM_WAKEUP_FAILURE;
    }
    return next<CURLMcode(CURLM*)>("curl_multi_wakeup")(multi);
}
}
#pragma GCC visibility pop

class NetworkScarcity : public NetworkFixture {
  protected:
    void expectAnAnswer() {
        const auto task = makeTask(server.getUrl());
        holder.submitNoRetries(task);
        EXPECT_EQ("finished 200", task->waitForEnd());
    }
};

TEST_F(NetworkScarcity, TaskWithoutDescriptorsAtFirstUseEndsAndTheNextOneWorks) {
    const auto task = makeTask(server.getUrl());
    {
        const NoDescriptors descriptors;
        holder.submitNoRetries(task);
        EXPECT_EQ("finished -1", task->waitForEnd());
    }
    expectAnAnswer();
}

TEST_F(NetworkScarcity, TaskWithoutDescriptorsForItsConnectionEndsAndTheNextOneWorks) {
    settle();  // the network thread runs
    const auto task = makeTask(server.getUrl());
    {
        const NoDescriptors descriptors;
        holder.submitNoRetries(task);
        EXPECT_EQ("finished -1", task->waitForEnd());
    }
    expectAnAnswer();
}

TEST_F(NetworkScarcity, LostWakeUpIsMadeUpForByTheNextCommand) {
    settle();
    wakeUpsToLose = 1;
    const auto lost = makeTask(server.getUrl());
    holder.submitNoRetries(lost);
    EXPECT_EQ(0, wakeUpsToLose);
    Network::NetworkTaskHolder other;
    const auto next = makeTask(server.getUrl());
    other.submitNoRetries(next);
    EXPECT_EQ("finished 200", lost->waitForEnd());
    EXPECT_EQ("finished 200", next->waitForEnd());
}

TEST_F(NetworkScarcity, CountsAsMeteredWhereTheKernelCannotBeAsked) {
    const NoDescriptors descriptors;
    EXPECT_FALSE(Network::listNetworkInterfaces());
    EXPECT_EQ(Network::NetworkManager::METERED,
              Network::NetworkManager::getInstance().getReachability());
}
