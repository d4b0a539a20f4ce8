#include "NetworkFixture.h"
#include "support/LogCapture.h"
#include "support/Threads.h"

using Network::HttpRequest;
using Network::NetworkTaskHolder;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

class NetworkTaskTest : public NetworkFixture {
  protected:
    /** Runs a task to its end and gives its last event. */
    std::string run(const boost::shared_ptr<RecordingTask>& task) {
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }
};

TEST_F(NetworkTaskTest, GoesThroughItsCallbacksInOrder) {
    server.script({Answer::status(200, {{"X-Answer", "42"}}, "hello")});
    const auto task = makeTask(server.getUrl() + "/path?a=b");
    EXPECT_EQ("finished 200", run(task));
    EXPECT_THAT(task->getEvents(),
                ElementsAre("ready?", "issue", "response 200", "bytes 5", "finished 200"));
    EXPECT_EQ("hello", task->getBody());
    EXPECT_EQ("42", task->getResponse()->getHeader("x-aNSWER"));
}

TEST_F(NetworkTaskTest, SendsTheRequestByteForByte) {
    const auto task = makeTask(server.getUrl() + "/a/../b?type=audio/x-pcm;bit=16&q='x'");
    EXPECT_EQ("finished 200", run(task));
    EXPECT_EQ("GET /a/../b?type=audio/x-pcm;bit=16&q='x' HTTP/1.1\r\nHost: 127.0.0.1:" +
                  std::to_string(server.getPort()) + "\r\nAccept: */*\r\n\r\n",
              server.getRequest(0).head);
}

TEST_F(NetworkTaskTest, SendsItsHeadersAndRefusesThoseThatWouldSplitTheRequest) {
    const std::string url = server.getUrl();
    const auto task = boost::make_shared<RecordingTask>([url] {
        auto request = HttpRequest::create(url + "/", "GET", REQUEST_TIMEOUT_MS, false);
        request->addHeader("X-One", "first value");
        request->addHeader("X-Empty", "");
        request->addHeader("X-Bad", "a\r\nX-Injected: b");
        request->addHeader("X-Bad\n", "c");
        request->addHeader("X: y", "d");
        return request;
    });
    const TestSupport::LogCapture log;
    EXPECT_EQ("finished 200", run(task));
    EXPECT_EQ("GET / HTTP/1.1\r\nHost: 127.0.0.1:" + std::to_string(server.getPort()) +
                  "\r\nAccept: */*\r\nX-One: first value\r\nX-Empty:\r\n\r\n",
              server.getRequest(0).head);
    EXPECT_EQ(3U, log.count("HttpRequest: a header that is not well-formed was refused"));
}

TEST_F(NetworkTaskTest, UsesTheConnectionAgain) {
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ("finished 200", run(makeTask(server.getUrl())));
    }
    EXPECT_EQ(3U, server.getRequestCount());
    EXPECT_EQ(1U, server.getConnectionCount());
}

TEST_F(NetworkTaskTest, OpensAnotherConnectionWhenThePeerHasClosedTheOldOne) {
    server.script({Answer::status(200).thenClose()});
    EXPECT_EQ("finished 200", run(makeTask(server.getUrl())));
    EXPECT_EQ("finished 200", run(makeTask(server.getUrl())));
    EXPECT_EQ(2U, server.getConnectionCount());
}

TEST_F(NetworkTaskTest, HandsTheBodyOnByPartsWhenAsked) {
    const std::string head = "HTTP/1.1 200 OK\r\nContent-Length: 11\r\n\r\n";
    server.script({Answer::raw(head + "firstsecond").inPieces(head.size() + 5)});
    const auto task = makeTask(server.getUrl());
    task->setByParts(true);
    holder.submitNoRetries(task);
    server.release();
    ASSERT_TRUE(task->waitFor("bytes 5"));
    server.release();
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("firstsecond", task->getBody());
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "response 200", "bytes 5",
                                               "bytes 6", "finished 200"));
}

TEST_F(NetworkTaskTest, FollowsTheBodyOfAnAnswerHoweverSlow) {
    server.script({Answer::raw("HTTP/1.1 200 OK\r\nContent-Length: 3\r\n\r\nabc").inPieces(7)});
    const auto task = makeTask(server.getUrl());
    holder.submitNoRetries(task);
    server.release(100);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("abc", task->getBody());
}

TEST_F(NetworkTaskTest, UnpacksAChunkedAnswer) {
    server.script(
        {Answer::raw("HTTP/1.1 200 OK\r\ntransfer-encoding: chunked\r\n\r\n"
                     "3\r\nabc\r\n2\r\nde\r\n0\r\nX-Trailer: t\r\n\r\n")});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished 200", run(task));
    EXPECT_EQ("abcde", task->getBody());
    EXPECT_THAT(task->getEvents(),
                ElementsAre("ready?", "issue", "response 200", "bytes 5", "finished 200"));
}

TEST_F(NetworkTaskTest, ReportsAnyStatusAsTheCode) {
    server.script({Answer::status(204), Answer::status(404), Answer::status(302)});
    EXPECT_EQ("finished 204", run(makeTask(server.getUrl())));
    EXPECT_EQ("finished 404", run(makeTask(server.getUrl())));
    EXPECT_EQ("finished 302", run(makeTask(server.getUrl())));
}

TEST_F(NetworkTaskTest, SkipsInterimAnswers) {
    server.script(
        {Answer::raw("HTTP/1.1 103 Early Hints\r\nX-Answer: early\r\n\r\n"
                     "HTTP/1.1 200 OK\r\nX-Answer: final\r\nContent-Length: 0\r\n\r\n")});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished 200", run(task));
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "response 200", "finished 200"));
    EXPECT_EQ("final", task->getResponse()->getHeader("X-Answer"));
}

TEST_F(NetworkTaskTest, JoinsFoldedHeaderLines) {
    server.script(
        {Answer::raw("HTTP/1.1 200 OK\r\nX-Long: one\r\n\ttwo\r\n \r\n"
                     "Content-Length: 0\r\n\r\n")});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished 200", run(task));
    EXPECT_THAT(task->getResponse()->getHeader("X-Long").value_or(""),
                ::testing::AllOf(::testing::StartsWith("one"), ::testing::EndsWith("two")));
}

TEST_F(NetworkTaskTest, FollowsRedirectsOnlyWhenAsked) {
    const TestSupport::Headers location{{"Location", server.getUrl() + "/other"}};
    server.script({Answer::status(302, location, "moved"), Answer::status(200, {}, "there"),
                   Answer::status(302, location)});
    const auto follower = makeTask(server.getUrl() + "/one", "GET", true);
    EXPECT_EQ("finished 200", run(follower));
    EXPECT_THAT(follower->getEvents(),
                ElementsAre("ready?", "issue", "response 200", "bytes 5", "finished 200"));
    EXPECT_EQ("GET /other HTTP/1.1", server.getRequest(1).line());
    EXPECT_EQ("finished 302", run(makeTask(server.getUrl() + "/one")));
    EXPECT_EQ(3U, server.getRequestCount());
}

TEST_F(NetworkTaskTest, NeverFollowsARedirectToAnotherScheme) {
    server.script({Answer::status(302, {{"Location", "file:///etc/hostname"}})});
    EXPECT_EQ("finished -1", run(makeTask(server.getUrl(), "GET", true)));
}

TEST_F(NetworkTaskTest, EndsARedirectLoop) {
    server.setDefaultAnswer(Answer::status(302, {{"Location", server.getUrl()}}));
    EXPECT_EQ("finished -1", run(makeTask(server.getUrl(), "GET", true)));
    EXPECT_EQ(11U, server.getRequestCount());
}

TEST_F(NetworkTaskTest, AcceptsAHeaderOfNinetyKilobytes) {
    const std::string value(90000, 'v');
    server.script({Answer::status(200, {{"x-big", value}})});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished 200", run(task));
    EXPECT_EQ(value, task->getResponse()->getHeader("X-Big"));
}

TEST_F(NetworkTaskTest, FailsCleanlyOnAHeaderBeyondTheLimit) {
    server.script({Answer::status(200, {{"x-big", std::string(2000000, 'v')}})});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished -1", run(task));
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -1"));
}

TEST_F(NetworkTaskTest, FailsCleanlyOnHeadersWithoutEnd) {
    const std::string line = "X-Filler: " + std::string(1000, 'v') + "\r\n";
    std::string many;
    while (many.size() < 250000) {
        many += line;
    }
    const std::string begin = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n";
    server.script({Answer::raw(begin + many + "\r\n"), Answer::raw(begin + many + many)});
    EXPECT_EQ("finished 200", run(makeTask(server.getUrl())));
    const TestSupport::LogCapture log;
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished -1", run(task));
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -1"));
    EXPECT_EQ(1U, log.count("Network: the head of a response is too large"));
}

TEST_F(NetworkTaskTest, FailsOnABodyBeyondWhatItCollects) {
    const std::string most(std::size_t{1024} * 1024, 'b');
    server.script({Answer::status(200, {}, most), Answer::status(200, {}, most + "b")});
    const auto fitting = makeTask(server.getUrl());
    EXPECT_EQ("finished 200", run(fitting));
    EXPECT_EQ(most.size(), fitting->getBody().size());
    const auto beyond = makeTask(server.getUrl());
    EXPECT_EQ("finished -1", run(beyond));
    EXPECT_EQ(0U, beyond->getBody().size());
}

TEST_F(NetworkTaskTest, FailsWhenNobodyListens) {
    const TestSupport::RefusingPort port;
    const auto task = makeTask(port.getUrl());
    EXPECT_EQ("finished -1", run(task));
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -1"));
}

TEST_F(NetworkTaskTest, FailsWhenThePeerClosesWithoutAnAnswer) {
    server.script({Answer::closing()});
    EXPECT_EQ("finished -1", run(makeTask(server.getUrl())));
}

TEST_F(NetworkTaskTest, FailsWhenTheAnswerIsCutShort) {
    server.script({Answer::raw("HTTP/1.1 200 OK\r\nContent-Length: 10\r\n\r\nabc").thenClose()});
    const auto task = makeTask(server.getUrl());
    EXPECT_EQ("finished -1", run(task));
    EXPECT_EQ("", task->getBody());
}

TEST_F(NetworkTaskTest, FailsOnAnAnswerThatIsNotHttp) {
    server.script({Answer::raw("220 mail.example.org ESMTP\r\n").thenClose()});
    EXPECT_EQ("finished -1", run(makeTask(server.getUrl())));
}

TEST_F(NetworkTaskTest, RefusesUrlsThatCouldSplitTheRequest) {
    for (const char* const tail :
         {" HTTP/1.1\r\nX-Injected: 1", "\r", "\n", "\t", "a b", "\x7F", "\x01"}) {
        const auto task = makeTask(server.getUrl() + "/?uuid=" + tail);
        EXPECT_EQ("finished -4", run(task));
        EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -4"));
    }
    std::string zero = server.getUrl() + "/?uuid=";
    zero += '\0';
    EXPECT_EQ("finished -4", run(makeTask(zero)));
    EXPECT_EQ(0U, server.getConnectionCount());
}

TEST_F(NetworkTaskTest, RefusesUrlsThatWouldNotBeSentAsTheyStand) {
    const std::string host = server.getUrl().substr(7);
    for (const std::string& url :
         {"http://user:password@" + host, "http://@" + host, "http:///user@" + host,
          "http://" + host + "/?uuid=a#b", "http://" + host + "#", "http://a\\@" + host,
          "http://a%0d%0aX-Injected:@" + host}) {
        EXPECT_NE("finished 200", run(makeTask(url))) << url;
    }
    EXPECT_EQ(0U, server.getConnectionCount());
    EXPECT_EQ("finished 200", run(makeTask("http://" + host + "/a@b?c=d@e")));
}

TEST_F(NetworkTaskTest, RefusesOtherSchemesAndTextThatIsNoUrl) {
    for (const char* const url : {"ftp://127.0.0.1/", "file:///etc/hostname", "127.0.0.1", "",
                                  "http://", "http://[::1", "http://127.0.0.1:99999/"}) {
        EXPECT_EQ("finished -4", run(makeTask(url))) << url;
    }
    EXPECT_EQ("finished 200", run(makeTask("HTTP" + server.getUrl().substr(4))));
}

TEST_F(NetworkTaskTest, RefusesRequestsThatMakeNoSense) {
    const std::string url = server.getUrl();
    EXPECT_EQ("finished -4", run(boost::make_shared<RecordingTask>(nullptr)));
    EXPECT_EQ("finished -4", run(makeTask(url, "DELETE")));
    EXPECT_EQ("finished -4", run(boost::make_shared<RecordingTask>([url] {
                  auto request = HttpRequest::create(url, "GET", REQUEST_TIMEOUT_MS, false);
                  request->setBody("B", "text");
                  return request;
              })));
    EXPECT_EQ("finished -4", run(makeStream(url, nullptr)));
    EXPECT_EQ(0U, server.getConnectionCount());
}

TEST_F(NetworkTaskTest, EndsAtOnceWhenTheTaskIsNotReady) {
    const auto task = makeTask(server.getUrl());
    task->setReady(false);
    holder.submit(task, retry(0, 5));
    EXPECT_EQ("finished -3", task->waitForEnd());
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "finished -3"));
}

TEST_F(NetworkTaskTest, IgnoresProxiesOfTheEnvironment) {
    const TestSupport::RefusingPort proxy;
    ASSERT_EQ(0, setenv("http_proxy", proxy.getUrl().c_str(), 1));
    ASSERT_EQ(0, setenv("ALL_PROXY", proxy.getUrl().c_str(), 1));
    EXPECT_EQ("finished 200", run(makeTask(server.getUrl())));
    unsetenv("http_proxy");
    unsetenv("ALL_PROXY");
}

TEST_F(NetworkTaskTest, RunsTasksOfSeveralHoldersAtOnce) {
    server.setDefaultAnswer(Answer::status(200).held());
    std::vector<boost::shared_ptr<NetworkTaskHolder>> holders;
    std::vector<boost::shared_ptr<RecordingTask>> tasks;
    for (int i = 0; i < 5; ++i) {
        holders.push_back(boost::make_shared<NetworkTaskHolder>());
        tasks.push_back(makeTask(server.getUrl()));
        holders.back()->submitNoRetries(tasks.back());
    }
    ASSERT_TRUE(server.waitForRequest(5));
    server.release(5);
    for (const auto& task : tasks) {
        EXPECT_EQ("finished 200", task->waitForEnd());
    }
    EXPECT_EQ(5U, server.getConnectionCount());
}

TEST_F(NetworkTaskTest, LogsWhyARequestFailed) {
    const TestSupport::RefusingPort port;
    const TestSupport::LogCapture log;
    EXPECT_EQ("finished -1", run(makeTask(port.getUrl())));
    EXPECT_TRUE(log.containsPart("Network: a request failed: Failed to connect"));
}

// It would be taken for the answer to the next request, and the next one's for the one after that.
TEST_F(NetworkTaskTest, LeavesAKeptConnectionOnWhichSomethingCameUnasked) {
    const std::string first = "HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\nthe first";
    const std::string unasked = "HTTP/1.1 408 Late\r\nContent-Length: 0\r\n\r\n";
    server.script({Answer::raw(first + unasked).inPieces(first.size()),
                   Answer::status(200, {}, "the second")});
    server.release();
    const auto task = makeTask(server.getUrl());
    holder.submitNoRetries(task);
    ASSERT_EQ("finished 200", task->waitForEnd());
    server.release();
    ASSERT_TRUE(TestSupport::waitForThreads([this] { return server.isIdle(); }));

    const auto next = makeUpload(server.getUrl(), "body");
    holder.submitNoRetries(next);
    EXPECT_EQ("finished 200", next->waitForEnd());
    EXPECT_THAT(next->getEvents(),
                ElementsAre("ready?", "issue", "response 200", "bytes 10", "finished 200"));
    EXPECT_EQ("the second", next->getBody());
    EXPECT_EQ("body", server.getRequest(1).body);
    EXPECT_EQ(2U, server.getConnectionCount());
    // That one is kept again.
    const auto last = makeTask(server.getUrl());
    holder.submitNoRetries(last);
    EXPECT_EQ("finished 200", last->waitForEnd());
    EXPECT_EQ(2U, server.getConnectionCount());
}

}  // namespace
