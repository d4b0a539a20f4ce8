// One libcurl handle serves request after request: nothing of one may reach the next.
#include <curl/curl.h>
#include <dlfcn.h>

#include <atomic>
#include <string>
#include <utility>
#include <vector>

#include "NetworkFixture.h"

using Network::HttpRequest;
using TestSupport::Answer;

namespace {

std::atomic<int> handlesMade{0};

}  // namespace

// Stands before libcurl's function.
#pragma GCC visibility push(default)
extern "C" CURL* curl_easy_init() {
    ++handlesMade;
    return reinterpret_cast<CURL* (*)()>(dlsym(RTLD_NEXT, "curl_easy_init"))();
}
#pragma GCC visibility pop

class NetworkKeptHandle : public NetworkFixture {
  protected:
    std::string run(const boost::shared_ptr<RecordingTask>& task) {
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }

    /** A request line and the headers that every request has. */
    std::string headOf(const std::string& line) const {
        return line + " HTTP/1.1\r\nHost: 127.0.0.1:" + std::to_string(server.getPort()) +
               "\r\nAccept: */*\r\n";
    }

    std::string fetchTarget(const std::string& rest) {
        EXPECT_EQ("finished 200", run(makeTask(server.getUrl() + rest))) << rest;
        const std::string line = server.getRequest(server.getRequestCount() - 1).line();
        return line.substr(0, line.rfind(' '));
    }
};

TEST_F(NetworkKeptHandle, LeavesNothingOfARequestToTheNext) {
    const std::string url = server.getUrl();
    server.script({Answer::status(200), Answer::status(200),
                   Answer::status(302, {{"Location", url + "/other?d=4"}}), Answer::status(200),
                   Answer::status(200), Answer::status(302, {{"Location", url + "/far"}})});
    settle();  // libcurl has made one for its own use
    const int before = handlesMade;

    EXPECT_EQ("finished 200", run(boost::make_shared<RecordingTask>([url] {
                  auto request = HttpRequest::create(url + "/log?a=1", "GET", 1000, false);
                  request->addHeader("Authorization", "Bearer secret");
                  return request;
              })));
    EXPECT_EQ("finished 200", run(makeUpload(url + "/asrgw?b=2", "a whole body")));
    EXPECT_EQ("finished 200", run(makeTask(url + "/first?c=3", "GET", true)));
    const auto writer = boost::make_shared<Network::NetworkTaskWriter>();
    write(*writer, "streamed");
    writer->close();
    EXPECT_EQ("finished 200", run(makeStream(url + "/asrgw_chunked", writer)));
    EXPECT_EQ("finished 302", run(makeTask(url + "/log?e=5")));

    EXPECT_EQ(1, handlesMade - before);
    ASSERT_EQ(6U, server.getRequestCount());
    EXPECT_EQ(headOf("GET /log?a=1") + "Authorization: Bearer secret\r\n\r\n",
              server.getRequest(0).head);
    EXPECT_EQ(headOf("POST /asrgw?b=2") +
                  "Content-Type: multipart/form-data; boundary=BOUNDARY\r\n"
                  "Content-Length: 12\r\n\r\n",
              server.getRequest(1).head);
    EXPECT_EQ("a whole body", server.getRequest(1).body);
    EXPECT_EQ(headOf("GET /first?c=3") + "\r\n", server.getRequest(2).head);
    EXPECT_EQ(headOf("GET /other?d=4") + "\r\n", server.getRequest(3).head);
    EXPECT_EQ(headOf("POST /asrgw_chunked") + "Transfer-Encoding: chunked\r\n\r\n",
              server.getRequest(4).head);
    EXPECT_EQ("streamed", server.getRequest(4).body);
    EXPECT_EQ(headOf("GET /log?e=5") + "\r\n", server.getRequest(5).head);
    for (const std::size_t get : {0U, 2U, 3U, 5U}) {
        EXPECT_EQ("", server.getRequest(get).body) << get;
    }
}

TEST_F(NetworkKeptHandle, CallsTheTaskOfItsOwnRequestOnly) {
    server.script({Answer::status(200, {{"X-Answer", "one"}}, "first"),
                   Answer::status(200, {{"X-Answer", "two"}}, "second")});
    settle();  // libcurl has made one for its own use
    const int before = handlesMade;
    const auto first = makeUpload(server.getUrl(), "body");
    EXPECT_EQ("finished 200", run(first));
    const auto events = first->getEvents();
    const auto second = makeTask(server.getUrl() + "/?a=b");
    EXPECT_EQ("finished 200", run(second));
    EXPECT_EQ(1, handlesMade - before);
    EXPECT_EQ(events, first->getEvents());
    EXPECT_EQ("first", first->getBody());
    EXPECT_EQ("second", second->getBody());
    EXPECT_EQ("two", second->getResponse()->getHeader("X-Answer"));
}

// Where there is a query libcurl is given the target; the bytes are those of the whole address.
TEST_F(NetworkKeptHandle, SendsEachTargetAsLibcurlWouldMakeItOfTheAddress) {
    const std::vector<std::pair<std::string, std::string>> targets = {
        {"", "/"},
        {"/", "/"},
        {"/a", "/a"},
        {"?a=b", "/?a=b"},
        {"/?a=b", "/?a=b"},
        {"/?", "/?"},
        {"/a/../b/./c?d=../e", "/a/../b/./c?d=../e"},
        {"/a?b=c?d/e:@[]{}|\\^`\"<>'", "/a?b=c?d/e:@[]{}|\\^`\"<>'"},
        {"/a?b=%2e%00%zz%", "/a?b=%2e%00%zz%"},
        {"/a?b=\xC3\xA9", "/a?b=\xC3\xA9"},
        {"/\xC3\xA9?b=c", "/%c3%a9?b=c"},
        {"/{\"}?b=c", "/{\"}?b=c"},
        {"/a//b?http://other/c", "/a//b?http://other/c"},
        {"/long?" + std::string(9000, 'x'), "/long?" + std::string(9000, 'x')},
    };
    for (const auto& [rest, target] : targets) {
        EXPECT_EQ("GET " + target, fetchTarget(rest));
    }
}

TEST_F(NetworkKeptHandle, SendsTheTargetOfAnAddressWithTooManySlashes) {
    const auto task = makeTask("http:///" + server.getUrl().substr(7) + "/path?a=b");
    EXPECT_EQ("finished 200", run(task));
    EXPECT_EQ(headOf("GET /path?a=b") + "\r\n", server.getRequest(0).head);
}
