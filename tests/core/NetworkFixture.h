#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "core/network/HttpRequest.h"
#include "core/network/NetworkManager.h"
#include "core/network/NetworkTask.h"
#include "core/network/NetworkTaskHolder.h"
#include "core/network/NetworkTaskWriter.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "support/ScriptedHttpServer.h"

constexpr int REQUEST_TIMEOUT_MS = 30000;

/** A task that notes each call in plain words and lets a test wait for them. */
class RecordingTask : public Network::NetworkTask {
  public:
    using RequestMaker = std::function<boost::shared_ptr<Network::HttpRequest>()>;
    using Hook = std::function<void()>;

    explicit RecordingTask(RequestMaker requestMaker) : maker(std::move(requestMaker)) {}

    /** Called inside the operation of that name, under the event lock. Set before `submit`. */
    void setHook(const std::string& operation, Hook hook) { hooks[operation] = std::move(hook); }
    void setReady(bool value) { ready = value; }
    void setByParts(bool value) { byParts = value; }

    bool isReadyToPerform() const override {
        note("ready?");
        return ready;
    }

    boost::shared_ptr<Network::HttpRequest> issueRequest() const override {
        note("issue");
        return maker ? maker() : nullptr;
    }

    bool recieveResponseBodyByParts() const override { return byParts; }

    void onResponseRecieved(boost::shared_ptr<Network::HttpResponse> head) override {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            response = head;
        }
        note("response " + std::to_string(head->getStatus()));
    }

    void onBytesReceived(const std::vector<unsigned char>& bytes) override {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            body.append(bytes.begin(), bytes.end());
        }
        note("bytes " + std::to_string(bytes.size()));
    }

    void onFinished(int code) override { note("finished " + std::to_string(code)); }

    void onRetried() override { note("retried"); }

    std::vector<std::string> getEvents() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return events;
    }

    std::string getBody() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return body;
    }

    boost::shared_ptr<Network::HttpResponse> getResponse() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return response;
    }

    /** Waits for the `count`th call whose note begins with `text`. */
    bool waitFor(const std::string& text, int count = 1) const {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, TestSupport::SERVER_WAIT_DFLT, [this, &text, count] {
            int found = 0;
            for (const std::string& event : events) {
                found += event.compare(0, text.size(), text) == 0 ? 1 : 0;
            }
            return found >= count;
        });
    }

    /** Waits for the end; "" when there was none. */
    std::string waitForEnd() const {
        return waitFor("finished") ? getEvents().back() : std::string();
    }

  private:
    void note(const std::string& event) const {
        EXPECT_EQ(1, kdHoldsEventLockKOR()) << event;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            events.push_back(event);
            changed.notify_all();
        }
        const auto hook = hooks.find(event.substr(0, event.find(' ')));
        if (hook != hooks.end()) {
            hook->second();
        }
    }

    const RequestMaker maker;
    std::map<std::string, Hook> hooks;
    bool ready = true;
    bool byParts = false;
    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    mutable std::vector<std::string> events;
    std::string body;
    boost::shared_ptr<Network::HttpResponse> response;
};

/** A server, and a clock that only moves when the test moves it. */
class NetworkFixture : public ::testing::Test {
  protected:
    NetworkFixture() { kdUseManualClockKOR(1000); }
    ~NetworkFixture() override {
        Util::SingletonStorage::destroyAll();
        kdDrainEventsKOR();
        kdUseRealClockKOR();
    }

    static void advanceMs(int64_t milliseconds) { kdAdvanceClockKOR(milliseconds * 1000000); }

    /** Waits until the network thread has finished with what it sees now. */
    static void settle() {
        const auto barrier = boost::make_shared<RecordingTask>(nullptr);
        barrier->setReady(false);
        Network::NetworkTaskHolder barrierHolder;
        barrierHolder.submitNoRetries(barrier);
        EXPECT_EQ("finished -3", barrier->waitForEnd());
    }

    static boost::shared_ptr<RecordingTask> makeTask(const std::string& url,
                                                     const std::string& method = "GET",
                                                     bool followRedirects = false) {
        return boost::make_shared<RecordingTask>([url, method, followRedirects] {
            return Network::HttpRequest::create(url, method, REQUEST_TIMEOUT_MS, followRedirects);
        });
    }

    static boost::shared_ptr<RecordingTask> makeUpload(const std::string& url,
                                                       const std::string& body) {
        return boost::make_shared<RecordingTask>([url, body] {
            auto request = Network::HttpRequest::create(url, "POST", REQUEST_TIMEOUT_MS, false);
            request->setBody("BOUNDARY", body);
            return request;
        });
    }

    static boost::shared_ptr<RecordingTask> makeStream(
        const std::string& url, const boost::shared_ptr<Network::NetworkTaskWriter>& writer) {
        return boost::make_shared<RecordingTask>([url, writer] {
            auto request = Network::HttpRequest::create(url, "POST", REQUEST_TIMEOUT_MS, false);
            request->setChunked(true);
            request->setWriter(writer);
            return request;
        });
    }

    static void write(Network::NetworkTaskWriter& writer, const std::string& text) {
        EXPECT_EQ(static_cast<int>(text.size()), writer.write(text.data(), text.size()));
    }

    static boost::shared_ptr<Network::NetworkTaskRetryPolicy> retry(int delayMs, int attempts) {
        return boost::make_shared<Network::NetworkTaskBasicRetryPolicy>(delayMs, attempts, false);
    }

    TestSupport::ScriptedHttpServer server;
    Network::NetworkTaskHolder holder;
};
