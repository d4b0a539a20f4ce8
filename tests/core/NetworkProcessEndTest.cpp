#include <cstdlib>
#include <functional>
#include <future>

#include "NetworkFixture.h"

using TestSupport::Answer;

namespace {

/** Each test ends a process of its own in the middle of a request. */
class NetworkProcessEndDeathTest : public NetworkFixture {
  protected:
    void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

const ::testing::ExitedWithCode CLEANLY(0);

/** Does something when it is destroyed: at the end of the process, if it is static. */
class AtItsEnd {
  public:
    explicit AtItsEnd(std::function<void()> what) : action(std::move(what)) {}
    ~AtItsEnd() { action(); }
    AtItsEnd(const AtItsEnd&) = delete;
    AtItsEnd& operator=(const AtItsEnd&) = delete;

  private:
    const std::function<void()> action;
};

void logEvents(const RecordingTask& task) {
    std::string line = "events:";
    for (const std::string& event : task.getEvents()) {
        line += " " + event;
    }
    kdLogMessage(line.c_str());
}

TEST_F(NetworkProcessEndDeathTest, SilencesTheTasksThatRun) {
    EXPECT_EXIT(
        {
            // Ends, with its threads, after the network thread.
            static TestSupport::ScriptedHttpServer peer;
            peer.setDefaultAnswer(Answer::never());
            const auto task = makeTask(peer.getUrl());
            static const AtItsEnd last([task] { logEvents(*task); });
            holder.submit(task, retry(0, 10));
            peer.waitForRequest(1);
            std::exit(0);
        },
        CLEANLY, "events: ready\\? issue\n$");
}

TEST_F(NetworkProcessEndDeathTest, SilencesAnAnswerThatComesAfterTheEndOfDeliveries) {
    EXPECT_EXIT(
        {
            // Ends, with its threads, after the network thread.
            static TestSupport::ScriptedHttpServer peer;
            peer.setDefaultAnswer(
                Answer::raw("HTTP/1.1 200 OK\r\n\r\nuntil the end").thenClose().held());
            const auto task = makeTask(peer.getUrl());
            static const AtItsEnd last([task] { logEvents(*task); });
            holder.submit(task, retry(0, 10));
            peer.waitForRequest(1);
            // While the network thread runs, but deliveries have ended. The connection is closed
            // when the client has read all.
            static const AtItsEnd first([] {
                peer.release();
                kdLogMessage(peer.waitForClosed(1) ? "all was read" : "too late");
            });
            kdEndEventsFirstKOR();
            std::exit(0);
        },
        CLEANLY, "all was read\n(.*\n)*events: ready\\? issue\n$");
}

TEST_F(NetworkProcessEndDeathTest, MayBeginInsideACallbackOnTheNetworkThread) {
    for (const std::string operation : {"ready?", "issue", "response", "bytes"}) {
        EXPECT_EXIT(
            {
                server.setDefaultAnswer(Answer::status(200, {}, "body"));
                const auto task = makeTask(server.getUrl());
                task->setHook(operation, [] { std::exit(0); });
                holder.submitNoRetries(task);
                std::promise<void>().get_future().wait();
            },
            CLEANLY, "");
    }
}

TEST_F(NetworkProcessEndDeathTest, EndsRequestsThatAreMadeTooLateInSilence) {
    EXPECT_EXIT(
        {
            const auto task = makeTask(server.getUrl());
            static const AtItsEnd last([task] { logEvents(*task); });
            static const AtItsEnd first([this, task] { holder.submitNoRetries(task); });
            settle();
            kdEndEventsFirstKOR();
            std::exit(0);
        },
        CLEANLY, "events:\n$");
}

}  // namespace
