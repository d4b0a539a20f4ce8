/**
 * @file
 * The engine, an application, a recorder and a gateway, in which a sequence happens.
 */
#pragma once

#include <array>
#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "CallTimes.h"
#include "Device.h"
#include "Plan.h"
#include "PlatformLedger.h"
#include "ScriptedGateway.h"
#include "Session.h"
#include "support/AssertCapture.h"
#include "talvox/Talvox.h"

namespace Lifecycle {

/** Runs sequences, one after the other. One at a time; the main thread is the application's. */
class Testbed : public GatewayObserver, public SessionHost, public DeviceHost {
  public:
    static constexpr int64_t CLOCK_START_MS = 1000000;

    Testbed();
    ~Testbed() override;
    Testbed(const Testbed&) = delete;
    Testbed& operator=(const Testbed&) = delete;

    /**
     * @param trace hears what happens, step by step; null for nobody
     * @return what went against the contract first, empty for nothing
     */
    std::string run(const Sequence& what, std::ostream* trace = nullptr);

    /** How often a session ended with results (index `ErrorMax`) or with an error, so far. */
    const std::array<long, Talvox::SpeechError::ErrorMax + 1>& getEnds() const { return ends; }

    /** Of the calls that came from outside of every event. */
    const std::map<Action, CallTimes>& getCallTimes() const { return callTimes; }

    // The session's and the gateway's side.
    void onEvent(Session& session, Event event, int errorCode) override;
    void onWrong(const std::string& what) override;
    int64_t now() const override;
    void onBody(int session, const std::string& body) override;
    void onHead(int session, bool words) override;
    void onAttemptEnd(int session, int code) override;
    bool onDeviceMade(int64_t handle) override;
    bool onDeviceAsked(int64_t handle, const std::string& what) override;

  private:
    static Talvox::Talvox& engine() { return Talvox::Talvox::getInstance(); }

    void begin(const Sequence& what);
    std::size_t performTogether(std::size_t index);
    void perform(const Step& step);
    void act(Action action, Session* target, int amount);
    void call(Action action, Session& session);
    void create(bool starts);
    void start(Session& session, Talvox::Recognizer& recognizer);
    std::optional<int> findRefusal(const Session& session) const;
    void callGetters(const Session* session);
    void useSettings(int index);
    void playSound(const Step& step, Session& session);
    void deliver(Session& session, const BufferPtr& buffer, bool rude);
    static void failRecorder(Session& session);
    void sayAsDevice(Session& session, Saying what);

    void wait(int64_t milliseconds);
    static void jump(int64_t milliseconds);
    void settle();
    void check();
    void checkEngine();
    void end();
    void checkNothingIsLeft();

    Session* find(int index);
    bool isAnyActive() const;
    template <typename... Parts>
    void note(const Parts&... parts) {
        if (out != nullptr) {
            *out << now() - CLOCK_START_MS << " ";
            (*out << ... << parts) << "\n";
        }
    }

    TestSupport::AssertCapture asserts;
    std::vector<boost::shared_ptr<Talvox::Settings>> settings;
    boost::shared_ptr<Talvox::Recognizer> probe;
    std::unique_ptr<Device> device;
    const Sequence* sequence = nullptr;
    int settingsInUse = 0;
    int reachability = 1;
    bool networkStands = false;
    std::size_t expectedAsserts = 0;
    PlatformLedger before;
    std::vector<std::unique_ptr<Session>> sessions;
    std::vector<Session*> starting;
    std::map<Action, CallTimes> callTimes;
    std::string wrong;
    std::array<long, Talvox::SpeechError::ErrorMax + 1> ends{};
    std::ostream* out = nullptr;
};

}  // namespace Lifecycle
