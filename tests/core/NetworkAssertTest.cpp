// Broken invariants of the network layer, and that it goes on after each report.
#include "NetworkFixture.h"
#include "core/util/Singleton.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"

namespace {

using Network::HttpRequest;
using Network::NetworkTaskHolder;
using ::testing::ElementsAre;
using TestSupport::AssertCapture;

class NetworkAssertTest : public NetworkFixture {
  protected:
    /** Runs one task to its end. @return its last event */
    std::string runTask() {
        const auto task = makeTask(server.getUrl());
        holder.submitNoRetries(task);
        return task->waitForEnd();
    }
};

TEST_F(NetworkAssertTest, TearDownByATaskOnTheNetworkThreadIsDoneAllTheSame) {
    const AssertCapture asserts;
    NetworkTaskHolder direct(NetworkTaskHolder::EndThread::NETWORK);
    const auto task = makeTask(server.getUrl());
    task->setHook("finished", [] { Util::SingletonStorage::destroyAll(); });
    direct.submitNoRetries(task);
    ASSERT_EQ(task->waitForEnd(), "finished 200");
    { const Util::EventLock afterTheHook; }
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "!isOwnThread");
    EXPECT_EQ(asserts.reports()[0].path, "core/src/network/curl/CurlTransport");
    EXPECT_EQ(runTask(), "finished 200");
}

TEST_F(NetworkAssertTest, RefusedRequestIsNeitherSentNorRetried) {
    const auto task = boost::make_shared<RecordingTask>([this] {
        auto request = HttpRequest::create(server.getUrl(), "GET", 1000, false);
        request->refuse("the language is empty");
        request->refuse("the model is empty");
        return request;
    });
    const TestSupport::LogCapture log;
    holder.submit(task, retry(0, 5));
    EXPECT_EQ(task->waitForEnd(), "finished -4");
    EXPECT_THAT(task->getEvents(), ElementsAre("ready?", "issue", "finished -4"));
    EXPECT_EQ(server.getConnectionCount(), 0U);
    EXPECT_EQ(log.count("Network: a request cannot be sent: the language is empty"), 1U);
}

TEST_F(NetworkAssertTest, RefusalWithoutAReasonIsReportedAndCountsForNothing) {
    const auto request = HttpRequest::create(server.getUrl(), "GET", 1000, false);
    const AssertCapture asserts;
    request->refuse("");
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "!reason.empty()");
    EXPECT_EQ(asserts.reports()[0].path, "core/src/network/HttpRequest");
    EXPECT_EQ(request->getRefusal(), "");
}

}  // namespace
