#include "NetworkFixture.h"
#include "network/FailureText.h"

using TestSupport::Answer;

namespace {

/** What a task says about its failure when it is over. */
class NetworkFailureReasonTest : public NetworkFixture {
  protected:
    static std::string finish(const boost::shared_ptr<RecordingTask>& task) {
        task->waitForEnd();
        const Util::EventLock lock;
        return task->getFailureReason();
    }

    std::string get(const std::string& url) {
        const auto task = makeTask(url);
        holder.submitNoRetries(task);
        return finish(task);
    }
};

TEST_F(NetworkFailureReasonTest, IsEmptyAfterASuccess) {
    EXPECT_EQ("", get(server.getUrl()));
    server.setDefaultAnswer(Answer::status(299));
    EXPECT_EQ("", get(server.getUrl()));
}

TEST_F(NetworkFailureReasonTest, IsTheStatusOfACompleteAnswer) {
    for (const int status : {300, 404, 500}) {
        server.setDefaultAnswer(Answer::status(status, {{"Retry-After", "1"}}));
        EXPECT_EQ("HTTP status " + std::to_string(status), get(server.getUrl()));
    }
}

TEST_F(NetworkFailureReasonTest, SaysThatTheServiceIsBusyWhenItAsksToComeBack) {
    server.setDefaultAnswer(Answer::status(503, {{"retry-after", "1"}}));
    EXPECT_EQ("HTTP status 503 (the service is busy)", get(server.getUrl()));
    server.setDefaultAnswer(Answer::status(503));
    EXPECT_EQ("HTTP status 503", get(server.getUrl()));
}

TEST_F(NetworkFailureReasonTest, IsKnownInsideOnFinishedAndToTheLastAttempt) {
    server.script({Answer::status(503), Answer::status(500)});
    const auto task = makeTask(server.getUrl());
    std::vector<std::string> reasons;
    for (const char* const operation : {"issue", "retried", "finished"}) {
        task->setHook(operation, [&] { reasons.push_back(task->getFailureReason()); });
    }
    holder.submit(task, retry(0, 2));
    EXPECT_EQ("finished 500", task->waitForEnd());
    const Util::EventLock lock;
    EXPECT_THAT(reasons, ::testing::ElementsAre("", "HTTP status 503", "HTTP status 503",
                                                "HTTP status 500"));
}

TEST_F(NetworkFailureReasonTest, IsEmptyWhenTheLastAttemptSucceeds) {
    server.script({Answer::status(503)});
    const auto task = makeTask(server.getUrl());
    holder.submit(task, retry(0, 2));
    EXPECT_EQ("", finish(task));
}

TEST_F(NetworkFailureReasonTest, IsLibcurlsTextWithoutAnAnswer) {
    const TestSupport::RefusingPort port;
    EXPECT_THAT(get(port.getUrl()), ::testing::StartsWith("Failed to connect to 127.0.0.1 port " +
                                                          std::to_string(port.getPort())));
    server.setDefaultAnswer(Answer::closing());
    EXPECT_EQ("Empty reply from server", get(server.getUrl()));
}

TEST_F(NetworkFailureReasonTest, NamesTheTimeOut) {
    server.setDefaultAnswer(Answer::never());
    const auto task = makeTask(server.getUrl());
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForRequest(1));
    settle();
    advanceMs(REQUEST_TIMEOUT_MS);
    EXPECT_EQ("no answer for 30 s", finish(task));
}

TEST_F(NetworkFailureReasonTest, NamesTheLimitOfHeadAndBody) {
    const std::string filler(60000, 'x');
    server.setDefaultAnswer(Answer::status(
        200, {{"A", filler}, {"B", filler}, {"C", filler}, {"D", filler}, {"E", filler}}));
    EXPECT_EQ("the head of the response is too large", get(server.getUrl()));
    server.setDefaultAnswer(Answer::status(200, {{"X", std::string(300000, 'x')}}));
    EXPECT_EQ("the head of the response is too large, or memory is short", get(server.getUrl()));
    server.setDefaultAnswer(Answer::status(200, {}, std::string(1024 * 1024 + 1, 'x')));
    EXPECT_EQ("the body of the response is too large", get(server.getUrl()));
}

TEST_F(NetworkFailureReasonTest, NamesWhatWasNeverSent) {
    EXPECT_EQ("the request cannot be sent: its URL is neither http nor https",
              get("ftp://127.0.0.1"));
    const auto none = boost::make_shared<RecordingTask>(nullptr);
    holder.submitNoRetries(none);
    EXPECT_EQ("the request cannot be sent: there is none", finish(none));
    const auto unready = makeTask(server.getUrl());
    unready->setReady(false);
    holder.submitNoRetries(unready);
    EXPECT_EQ("the request is not ready", finish(unready));
}

TEST_F(NetworkFailureReasonTest, HoldsNoneOfThePeersControlCharacters) {
    server.setDefaultAnswer(Answer::raw("HTTP/1.1 404 \x1B[2J\xFF\r\nContent-Length: 0\r\n\r\n"));
    EXPECT_EQ("HTTP status 404", get(server.getUrl()));
}

TEST_F(NetworkFailureReasonTest, IsCut) {
    const std::string label(60, 'n');
    const std::string reason =
        get("http://" + label + '.' + label + '.' + label + ".example.invalid");
    EXPECT_EQ("Could not resolve host: " + label, reason.substr(0, 84));
    EXPECT_EQ(200U, reason.size());
}

TEST(NetworkFailureText, IsOnePrintableLine) {
    EXPECT_EQ("a??b????~ c", Network::makeReason("a\r\nb\x1B\x7F\xFF\x80~ c"));
    EXPECT_EQ(std::string(200, 'x'), Network::makeReason(std::string(1000, 'x')));
    EXPECT_EQ("", Network::makeReason(""));
}

}  // namespace
