#include <dlfcn.h>
#include <netdb.h>

#include <condition_variable>
#include <cstring>
#include <future>
#include <mutex>

#include "NetworkFixture.h"

namespace {

const char* const SILENT_HOST = "silent.invalid";

/** Stands for a name server that never answers. */
class SilentNameServer {
  public:
    static SilentNameServer& instance() {
        static auto* const made = new SilentNameServer;
        return *made;
    }

    void ask() {
        std::unique_lock<std::mutex> lock(mutex);
        ++asked;
        changed.notify_all();
        changed.wait(lock, [this] { return released; });
        ++answered;
        changed.notify_all();
    }

    bool waitForQuestion() {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, TestSupport::SERVER_WAIT_DFLT,
                                [this] { return asked > answered; });
    }

    void hold() {
        const std::lock_guard<std::mutex> lock(mutex);
        released = false;
    }

    bool releaseAll() {
        std::unique_lock<std::mutex> lock(mutex);
        released = true;
        changed.notify_all();
        return changed.wait_for(lock, TestSupport::SERVER_WAIT_DFLT,
                                [this] { return asked == answered; });
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    int asked = 0;
    int answered = 0;
    bool released = false;
};

}  // namespace

// In front of the C library's function for this program and the libraries that it loads.
extern "C" __attribute__((visibility("default"))) int getaddrinfo(const char* node,
                                                                  const char* service,
                                                                  const addrinfo* hints,
                                                                  addrinfo** result) {
    if (node != nullptr && std::strcmp(node, SILENT_HOST) == 0) {
        SilentNameServer::instance().ask();
        return EAI_AGAIN;
    }
    using Function = int (*)(const char*, const char*, const addrinfo*, addrinfo**);
    static const auto real = reinterpret_cast<Function>(::dlsym(RTLD_NEXT, "getaddrinfo"));
    return real(node, service, hints, result);
}

namespace {

class NetworkResolverTest : public NetworkFixture {
  protected:
    NetworkResolverTest() { SilentNameServer::instance().hold(); }
    ~NetworkResolverTest() override { EXPECT_TRUE(SilentNameServer::instance().releaseAll()); }

    const std::string url = std::string("http://") + SILENT_HOST + "/";
};

TEST_F(NetworkResolverTest, TearsTheManagerDownWhileANameServerIsSilent) {
    const auto task = makeTask(url);
    holder.submitNoRetries(task);
    ASSERT_TRUE(SilentNameServer::instance().waitForQuestion());
    std::future<void> end =
        std::async(std::launch::async, [] { Util::SingletonStorage::destroyAll(); });
    EXPECT_EQ(std::future_status::ready, end.wait_for(std::chrono::seconds(2)));
    EXPECT_EQ("finished -1", task->waitForEnd());
}

TEST_F(NetworkResolverTest, ServesOthersAfterACancelWhileANameServerIsSilent) {
    holder.submitNoRetries(makeTask(url));
    ASSERT_TRUE(SilentNameServer::instance().waitForQuestion());
    holder.cancel();
    const auto next = makeTask(server.getUrl());
    holder.submitNoRetries(next);
    EXPECT_EQ("finished 200", next->waitForEnd());
}

TEST_F(NetworkResolverTest, BoundsTheWaitForAName) {
    const auto task = makeTask(url);
    holder.submitNoRetries(task);
    ASSERT_TRUE(SilentNameServer::instance().waitForQuestion());
    advanceMs(REQUEST_TIMEOUT_MS);
    EXPECT_EQ("finished -2", task->waitForEnd());
}

}  // namespace
