/**
 * @file
 * Usage events and errors of the application, delivered to a log collection endpoint.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <functional>
#include <map>
#include <set>
#include <string>

#include "core/util/Singleton.h"
#include "logcollector/LogEvent.h"
#include "logcollector/LogStoreOptions.h"
#include "talvox/Export.h"

namespace LogCollector {

class LogSender;

/**
 * Takes events that belong to named sessions and has each delivered as one record with one HTTP
 * request. One per process, made on first use; independent of the recognition engine. Off until
 * the application switches it on.
 *
 * Delivery: a record is kept until the endpoint has answered 200, however long that takes; it may
 * arrive more than once. Without a store (`openStore`) records are in memory only: what is not
 * delivered when the process ends is lost. Nothing is reported to the caller; what goes wrong is in
 * the log (see core/Logger.h).
 *
 * Threads: any, for every operation. Each takes the event lock and none waits for the network.
 */
class TALVOX_API LogCollector : public Util::Singleton<LogCollector> {
  public:
    /** How the collector's lines in the log begin. */
    static const std::string TAG;

    /** Where records go until the application says otherwise: a gateway on this machine. */
    static const std::string URL_DFLT;

    /** The one of the process, made on first use. */
    static LogCollector& getInstance();

    LogCollector(const LogCollector&) = delete;
    LogCollector& operator=(const LogCollector&) = delete;

    /** Drops what is neither delivered nor stored; a request that runs is given up. */
    ~LogCollector() override;

    /**
     * Switches logging on or off. While it is off, sessions cannot be opened or closed and events
     * are dropped, but open sessions stay open and what waits for delivery is delivered.
     */
    void setLoggingEnabled(bool value);
    bool isLoggingEnabled() const;

    /** Replaces the client identifier; it goes into the address as it is, so without any coding. */
    void configure(const std::string& clientUuid);

    /**
     * Replaces the client identifier and the endpoint's address, to which "?uuid=..." is appended.
     * Both hold for every request that is made from now on, also for records that wait. Nothing is
     * checked here: with an address or identifier that cannot be part of a request, records wait,
     * with one attempt in 20 seconds.
     */
    void configure(const std::string& clientUuid, const std::string& endpointUrl);

    /** What records are sent with; the defaults until `configure`. */
    std::string getUrl() const;
    std::string getUuid() const;

    /**
     * Stores the records in a folder, so that they outlive the process; off without this call.
     * Records that earlier processes left in the folder are delivered first, in the order in which
     * they were logged, also while logging is off; then those that wait already. Call `configure`
     * before: delivery begins at once. A store lasts as long as the collector.
     *
     * From then on a record is safe when `logEvent`, `logError` or `stopSession` returns: the death
     * of the process, however sudden, costs nothing. A power failure or a fault of the system may
     * cost the records that the system has not written to the disk by then, some seconds' worth;
     * nothing waits for the disk. Open sessions are not stored.
     *
     * A delivered record leaves the store. It arrives twice if the process ends between the answer
     * and that moment, which can happen to one record for each end of a process, or if the disk
     * refuses to have the record marked.
     *
     * When a bound of `options` is reached, the oldest records go, up to 1/16 of the bound at once.
     * A record of the session "logStore", type "error", name "logRecordsDropped", has their number
     * in its parameter "count"; while it waits, it counts on. If the process ends as that record
     * arrives, the next one counts the same records again.
     *
     * A record that cannot be stored (full disk, too long for the bound or for any request) stays
     * in memory, with a line in the log. Damaged parts of a store are left out, with a line in the
     * log; a delivered record among them may come back.
     *
     * Reads the folder's files on the calling thread without the event lock. Storing a record takes
     * one write of some hundred bytes under that lock.
     *
     * @return false when records stay in memory only: there is a store already, the folder cannot
     *         be made, read or written, another process uses it, or a later version wrote it. The
     *         log says which; another folder, or the same one later, may be tried.
     */
    bool openStore(const LogStoreOptions& options);

    /** Opens a session. Any bytes; compared byte by byte. Nothing is sent. */
    void startSession(const std::string& id);

    /** Sends the event "logSessionStopped" and closes the session. */
    void stopSession(const std::string& id);

    /**
     * Sends an event of an open session; for a session that is not open it is dropped.
     * @param params any bytes in names and values. A record of more than 1,000,000 bytes when
     *               percent-encoded cannot be sent: it is tried in vain and holds nothing else up.
     */
    void logEvent(const std::string& sessionId, const std::string& name,
                  const std::map<std::string, std::string>& params);

    /** As `logEvent`, with the type "error". */
    void logError(const std::string& sessionId, const std::string& name,
                  const std::map<std::string, std::string>& params);

    /** Records that are not delivered yet, with the one that is being sent. */
    std::size_t getPendingCount() const;

    /**
     * Sets what is called, on the event thread under the event lock, whenever the last pending
     * record has been delivered; an empty function for nothing. It must not block or throw.
     */
    void setDeliveredCallback(std::function<void()> callback);

  private:
    friend class Util::Singleton<LogCollector>;
    LogCollector();

    bool isOff(const char* operation) const;
    bool isOpen(const std::string& sessionId) const;
    void log(LogEvent::EventType type, const std::string& sessionId, const std::string& name,
             const std::map<std::string, std::string>& params);

    const boost::shared_ptr<LogSender> sender;
    std::set<std::string> sessions;
    std::string uuid;
    std::string url;
    bool enabled = false;
};

/** The operations of the one collector. */
TALVOX_API void setLoggingEnabled(bool value);
TALVOX_API bool isLoggingEnabled();
TALVOX_API void configure(const std::string& uuid);
TALVOX_API void configure(const std::string& uuid, const std::string& url);
TALVOX_API std::string getUrl();
TALVOX_API std::string getUuid();
TALVOX_API bool openStore(const LogStoreOptions& options);
TALVOX_API void startSession(const std::string& id);
TALVOX_API void stopSession(const std::string& id);
TALVOX_API void logEvent(const std::string& sessionId, const std::string& name,
                         const std::map<std::string, std::string>& params);
TALVOX_API void logError(const std::string& sessionId, const std::string& name,
                         const std::map<std::string, std::string>& params);
TALVOX_API std::size_t getPendingCount();
TALVOX_API void setDeliveredCallback(std::function<void()> callback);

}  // namespace LogCollector
