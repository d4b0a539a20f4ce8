/**
 * @file
 * Reachability and the owner of the network thread.
 */
#pragma once

#include <boost/scoped_ptr.hpp>
#include <boost/shared_ptr.hpp>
#include <string>

#include "core/Export.h"
#include "core/util/Singleton.h"

namespace Network {

class Transport;

/**
 * The process's view of the network. Connections go straight to the host of the URL: settings come
 * from the application only, so proxies named by environment variables are not used.
 */
class KORVEL_CORE_API NetworkManager : public Util::Singleton<NetworkManager> {
  public:
    /** Reachability: 0 and 1 are fixed; every other value is a connection that is metered. */
    enum Reachability { UNREACHABLE = 0, WIFI = 1, METERED = 2 };

    /** The one of the process, made on first use. */
    static NetworkManager& getInstance();

    /**
     * Ends all transfers and the network thread; bounded, whatever the peers do. Their tasks end
     * with `NO_RESPONSE` and without a retry; at the end of the process they hear nothing. The
     * event lock, under which singletons are deleted, is lent to the network thread meanwhile. Must
     * not happen inside a callback of a task that runs on the network thread, unless that callback
     * ends the process.
     */
    ~NetworkManager() override;

    /**
     * How the network can be reached now: the embedder's word if there is one, else what the
     * system says. A host that has only its loopback interface counts as 1. Where the system
     * cannot be asked, the network counts as metered, so that the attempt itself decides. Any
     * thread; never waits for the network.
     */
    int getReachability() const;

    /** Sets the embedder's word; -1 takes it back. Any thread. */
    void overrideReachability(int value);

    /**
     * PEM file with certificate authorities to trust beside the system's; empty for the system's
     * alone. Concerns connections opened afterwards. They read the file once, and again after a
     * certificate was refused; while it cannot be read or holds no certificate, they fail. Any
     * thread.
     */
    void setCertificateFile(const std::string& path);

    /** What carries the requests of tasks that are submitted now. Any thread. */
    boost::shared_ptr<Transport> getTransport() const;

    /**
     * Has another transport carry the requests of tasks that are submitted afterwards, in tests for
     * example. The one before is stopped, as by the destructor. Any thread.
     * @param transport null for libcurl's
     */
    void setTransport(const boost::shared_ptr<Transport>& transport);

  private:
    friend class Util::Singleton<NetworkManager>;
    NetworkManager();

    class Impl;
    boost::scoped_ptr<Impl> impl;
};

}  // namespace Network
