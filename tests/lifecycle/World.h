/**
 * @file
 * The engine, an application, a recorder and a gateway, in which a sequence happens.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <iosfwd>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Plan.h"
#include "PlatformLedger.h"
#include "ScriptedGateway.h"
#include "Session.h"
#include "support/AssertCapture.h"
#include "talvox/Talvox.h"

namespace Lifecycle {

/** Runs sequences, one after the other. One at a time; the main thread is the application's. */
class World : public GatewayObserver, public SessionHost {
  public:
    World();
    ~World() override;
    World(const World&) = delete;
    World& operator=(const World&) = delete;

    /**
     * @param trace hears what happens, step by step; null for nobody
     * @return what went against the contract first, empty for nothing
     */
    std::string run(const Sequence& what, std::ostream* trace = nullptr);

    // The session's and the gateway's side.
    void onEvent(Session& session, Event event, int errorCode) override;
    void onWrong(const std::string& what) override;
    int64_t now() const override;
    void onBody(int session, const std::string& body) override;
    void onHead(int session, bool words) override;
    void onAttemptEnd(int session, int code) override;

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

    void wait(int64_t milliseconds);
    static void jump(int64_t milliseconds);
    void settle();
    void check();
    void checkEngine();
    void end();
    void checkNothingIsLeft();

    Session* find(int index);
    bool isAnyActive() const;
    void note(const std::string& line);

    TestSupport::AssertCapture asserts;
    std::vector<boost::shared_ptr<Talvox::Settings>> settings;
    boost::shared_ptr<Talvox::Recognizer> probe;
    const Sequence* sequence = nullptr;
    int settingsInUse = 0;
    int reachability = 1;
    bool networkStands = false;
    PlatformLedger before;
    std::vector<std::unique_ptr<Session>> sessions;
    std::vector<Session*> starting;
    std::string wrong;
    std::ostream* out = nullptr;
};

}  // namespace Lifecycle
