/**
 * @file
 * The network thread and all that lies behind it, without a thread and without a network.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <functional>
#include <list>
#include <string>
#include <vector>

#include "Plan.h"
#include "core/network/Transport.h"

namespace Lifecycle {

class ScriptedTransfer;

/** Hears what the gateway does with the requests of a session; under the event lock. */
class GatewayObserver {
  public:
    virtual ~GatewayObserver() = default;

    /** The whole body of a request has arrived. */
    virtual void onBody(int session, const std::string& body) = 0;
    /** The head of an answer goes out; `words`: its header holds results. */
    virtual void onHead(int session, bool words) = 0;
    /** An attempt is over; `code` as for a network task. */
    virtual void onAttemptEnd(int session, int code) = 0;
};

/**
 * Stands in for libcurl and the gateway below the real task holders, exchanges, retry policies and
 * watchdogs: `ScriptedTransport` hands it the commands for the network thread and the transfers,
 * and a test lets it take its turns. Under the event lock.
 */
class ScriptedGateway {
  public:
    /** One attempt as it looks from here. */
    struct Link {
        boost::shared_ptr<ScriptedTransfer> transfer;
        boost::shared_ptr<Network::TransferListener> listener;
        std::string url;
        /** Appends what there is of the body, up to so many bytes. @return true at its end */
        std::function<bool(std::string& body, std::size_t most)> read;
    };

    static ScriptedGateway& instance();

    /** Forgets the sequence before. The plans must stay where they are. */
    void begin(const std::vector<SessionPlan>& plans, GatewayObserver* watcher);

    /**
     * The network thread does one thing: runs its commands, or does what is next for one transfer.
     * @return false when there is nothing to be done at this time
     */
    bool turn();

    /** Whether peers are quicker than the network thread's commands, from now on. */
    void setAnswersFirst(bool value) { answersFirst = value; }

    /** When there will be something to do, on the platform clock; the largest number for never. */
    int64_t getNextDue() const;

    std::size_t countTransfers() const { return connections.size(); }

    /** What every words of a session are, and the identifier of its request. */
    static std::string makeWords(int session);
    static std::string makeRequestId(int session);
    static std::string makeSessionId(int session);

    // For the transport.
    void setCommandRunner(std::function<bool()> runner) { runCommands = std::move(runner); }
    void connect(Link link);
    bool disconnect(const boost::shared_ptr<ScriptedTransfer>& transfer);
    /** The transfer is over: tells it. */
    void end(const boost::shared_ptr<ScriptedTransfer>& transfer, int code);

  private:
    enum class Phase { RECEIVING, ANSWERING, HEAD_SENT };

    struct Connection {
        Link link;
        int session;
        AttemptPlan plan;
        std::string body;
        bool bodyEnded = false;
        Phase phase = Phase::RECEIVING;
        int64_t due = 0;
    };
    using Connections = std::list<Connection>;

    ScriptedGateway() = default;

    AttemptPlan takePlan(int session);
    bool serveAny();
    bool serve(Connection& connection);
    bool receive(Connection& connection);
    void act(Connection& connection);
    void sendHead(Connection& connection);
    void sendEnd(Connection& connection);
    void finish(const Connection& connection, int code);

    std::function<bool()> runCommands;
    const std::vector<SessionPlan>* sessions = nullptr;
    std::vector<std::size_t> attempts;
    GatewayObserver* observer = nullptr;
    Connections connections;
    bool answersFirst = false;
};

}  // namespace Lifecycle
