#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include "gateway/DecoderPool.h"
#include "gateway/RecordLog.h"
#include "gateway/SessionList.h"
#include "gateway/SpeechModel.h"

struct MHD_Daemon;
struct addrinfo;

namespace Gateway {

/** How the gateway is to run. */
struct ServerOptions {
    static constexpr std::size_t MAX_BODY_BYTES_DFLT = std::size_t{16} * 1024 * 1024;

    /** Address to listen on: numeric, or a name that the system knows. */
    std::string host = "127.0.0.1";
    /** Port, 0 for any that is free. */
    uint16_t port = 8090;
    std::size_t maxBodyBytes = MAX_BODY_BYTES_DFLT;
    /** Requests that are recognised at the same time; further ones wait. */
    std::size_t decoders = 2;
    /** Longest wait for a free decoder after the end of a request, in milliseconds. */
    unsigned decoderWaitMs = DecoderPool::WAIT_MS_DFLT;
    /** Seconds after which a client that says nothing is given up. */
    unsigned idleSeconds = 30;
    bool verbose = false;
    /** Serve the page of the last sessions at "/"; on a loopback address only. */
    bool hasPage = false;
    /** File to which usage records are appended; empty for the standard output. */
    std::string recordFile;
    SpeechModel model;
};

/**
 * The HTTP face of the gateway: a thread per connection, each of which carries one request after
 * the other into a `RecognitionRequest` or the log of records. `start` and `stop` belong to one
 * thread.
 */
class Server {
  public:
    explicit Server(const ServerOptions& serverOptions);
    /** Stops. */
    ~Server();
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;

    /** Loads the model and begins to listen, once. @return an empty text, or why that is impossible
     */
    std::string start();

    /** Ends all connections and waits for their threads; does nothing when stopped. */
    void stop();

    /** The port on which the server listens, 0 before `start`. */
    uint16_t getPort() const { return port; }

    /** `http://HOST:PORT` as a client of this machine can use it. */
    std::string getUrl() const;

    const ServerOptions& getOptions() const { return options; }
    DecoderPool& getPool() { return pool; }
    RecordLog& getRecordLog() { return recordLog; }
    /** What the page shows; null without the page. */
    SessionList* getSessions() { return sessions.get(); }

    /** Whether only programs of this machine reach the server; known after `start`. */
    bool isOnLoopback() const { return onLoopback; }

  private:
    void listen(const addrinfo& address);

    const ServerOptions options;
    DecoderPool pool;
    RecordLog recordLog;
    const std::unique_ptr<SessionList> sessions;
    bool onLoopback = true;
    MHD_Daemon* daemon = nullptr;
    uint16_t port = 0;
};

}  // namespace Gateway
