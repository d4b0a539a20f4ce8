#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <future>

#include "NetworkFixture.h"

using Network::NetworkTaskWriter;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

using NetworkTimeoutTest = NetworkFixture;

/** A port whose queue of connections is full: the handshake is never finished. */
class DeafPort {
  public:
    DeafPort() {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        auto* const generic = reinterpret_cast<sockaddr*>(&address);
        socklen_t length = sizeof(address);
        listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        EXPECT_EQ(0, ::bind(listener, generic, length));
        EXPECT_EQ(0, ::listen(listener, 0));
        EXPECT_EQ(0, ::getsockname(listener, generic, &length));
        port = ntohs(address.sin_port);
        for (int& filler : fillers) {
            filler = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
            EXPECT_TRUE(::connect(filler, generic, length) == 0 || errno == EINPROGRESS);
        }
    }
    ~DeafPort() {
        for (const int filler : fillers) {
            ::close(filler);
        }
        ::close(listener);
    }
    DeafPort(const DeafPort&) = delete;
    DeafPort& operator=(const DeafPort&) = delete;

    std::string getUrl() const { return "http://127.0.0.1:" + std::to_string(port); }

  private:
    int listener = -1;
    int fillers[4] = {};
    unsigned short port = 0;
};

TEST_F(NetworkTimeoutTest, BoundsTheConnecting) {
    const DeafPort port;
    const auto task = makeTask(port.getUrl());
    holder.submitNoRetries(task);
    ASSERT_TRUE(task->waitFor("issue"));
    advanceMs(REQUEST_TIMEOUT_MS - 1);
    settle();
    EXPECT_TRUE(holder.isWorking());
    advanceMs(1);
    EXPECT_EQ("finished -2", task->waitForEnd());
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -2"));
}

TEST_F(NetworkTimeoutTest, BoundsTheWaitForTheAnswer) {
    server.script({Answer::never()});
    const auto task = makeUpload(server.getUrl(), "body");
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS - 1);
    settle();
    EXPECT_TRUE(holder.isWorking());
    advanceMs(1);
    EXPECT_EQ("finished -2", task->waitForEnd());
    EXPECT_TRUE(server.waitForClosed(1));
}

TEST_F(NetworkTimeoutTest, BoundsTheWaitForMoreOfAnAnswer) {
    const std::string head = "HTTP/1.1 200 OK\r\nContent-Length: 2\r\n\r\n";
    server.script({Answer::raw(head + "ab").inPieces(head.size() + 1)});
    const auto task = makeTask(server.getUrl());
    task->setByParts(true);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS / 2);
    server.release();
    ASSERT_TRUE(task->waitFor("bytes"));
    settle();
    // The time begins again with the piece that came.
    advanceMs(REQUEST_TIMEOUT_MS - 1);
    settle();
    EXPECT_TRUE(holder.isWorking());
    advanceMs(1);
    EXPECT_EQ("finished -2", task->waitForEnd());
}

TEST_F(NetworkTimeoutTest, DoesNotCountTheTimeInWhichTheBodyIsWritten) {
    const auto writer = boost::make_shared<NetworkTaskWriter>();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForHead(1));
    for (std::size_t i = 1; i <= 5; ++i) {
        write(*writer, "x");
        ASSERT_TRUE(server.waitForBody(0, i));
        settle();
        advanceMs(int64_t{20} * REQUEST_TIMEOUT_MS);
        settle();
        EXPECT_TRUE(holder.isWorking());
    }
    writer->close();
    EXPECT_EQ("finished 200", task->waitForEnd());
}

TEST_F(NetworkTimeoutTest, CountsFromTheEndOfTheBody) {
    server.script({Answer::never()});
    const auto writer = boost::make_shared<NetworkTaskWriter>();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    write(*writer, "x");
    ASSERT_TRUE(server.waitForBody(0, 1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS / 3);
    writer->close();
    ASSERT_TRUE(server.waitForRequest(1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS - 1);
    settle();
    EXPECT_TRUE(holder.isWorking());
    advanceMs(1);
    EXPECT_EQ("finished -2", task->waitForEnd());
}

TEST_F(NetworkTimeoutTest, BoundsTheTakingOfBytes) {
    server.script({Answer::status(200).notReading()});
    std::string more;  // than the buffers of both ends take
    more.resize(30000000, 'x');
    const auto task = makeUpload(server.getUrl(), more);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForHead(1));
    // Until the buffers between the two are full, there is progress, at the time of the clock.
    for (int i = 0; i < 100 && holder.isWorking(); ++i) {
        advanceMs(REQUEST_TIMEOUT_MS);
        settle();
    }
    EXPECT_EQ("finished -2", task->waitForEnd());
}

TEST_F(NetworkTimeoutTest, IsTriedAgainByAPolicyThatSaysSo) {
    server.script({Answer::never()});
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(0, 2));
    ASSERT_TRUE(server.waitForRequest(1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_THAT(task->getEvents(),
                ElementsAre("ready?", "issue", "retried", "issue", "response 200", "finished 200"));
}

TEST_F(NetworkTimeoutTest, KeepsAnAnswerThatArrivedInTime) {
    // The answer lies in the socket while the network thread is kept from looking at it.
    server.setDefaultAnswer(Answer::status(200).held());
    const auto busy = makeTask(server.getUrl());
    const auto task = makeTask(server.getUrl());
    std::promise<void> inside;
    std::promise<void> leave;
    busy->setHook("response", [&] {
        inside.set_value();
        leave.get_future().wait();
    });
    Network::NetworkTaskHolder busyHolder;
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    busyHolder.submitNoRetries(busy);
    ASSERT_TRUE(server.waitForRequest(2));
    server.release(2);
    inside.get_future().wait();
    std::thread clock([] { advanceMs(REQUEST_TIMEOUT_MS); });
    leave.set_value();
    clock.join();
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("finished 200", busy->waitForEnd());
}

TEST_F(NetworkTimeoutTest, HasNoBoundWithoutATime) {
    server.script({Answer::status(200).held()});
    const std::string url = server.getUrl();
    const auto task = boost::make_shared<RecordingTask>(
        [url] { return Network::HttpRequest::create(url, "GET", 0, false); });
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    advanceMs(int64_t{1000} * REQUEST_TIMEOUT_MS);
    settle();
    EXPECT_TRUE(holder.isWorking());
    server.release();
    EXPECT_EQ("finished 200", task->waitForEnd());
}

}  // namespace
