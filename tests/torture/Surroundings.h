/**
 * @file
 * What a victim talks to.
 */
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Order.h"
#include "Plan.h"
#include "support/PulseServer.h"
#include "support/ScratchDirectory.h"
#include "support/ScriptedHttpServer.h"
#include "support/TlsRelay.h"

namespace Torture {

/** Bodies of the complete requests that one point's two sessions sent. */
struct Traffic {
    std::vector<std::string> first;
    std::vector<std::string> next;
};

/**
 * Fresh servers for one point after another, on the loopback interface, and a folder. One thread
 * uses it.
 */
class Surroundings {
  public:
    Surroundings();

    /** Ends the servers of the last point and fills in the addresses of new ones. */
    void prepare(const Plan& plan, Order& order);

    /** What arrived since. */
    Traffic getTraffic() const;

    /** Why a session cannot be run here; empty when it can. */
    std::string findObstacle(const Plan& plan) const;

  private:
    void startRelay();

    TestSupport::ScratchDirectory directory;
    std::unique_ptr<TestSupport::ScriptedHttpServer> gateway;
    std::unique_ptr<TestSupport::ScriptedHttpServer> nextGateway;
    std::unique_ptr<TestSupport::ScriptedHttpServer> logServer;
    std::unique_ptr<TestSupport::TlsRelay> relay;
    std::string tlsFault;
};

}  // namespace Torture
