/**
 * @file
 * An HTTP server on the loopback interface that does what a test tells it, however rude.
 */
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <deque>
#include <limits>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace TestSupport {

using Headers = std::vector<std::pair<std::string, std::string>>;

/** Longest wait of the server's wait operations: beyond it a test has failed anyway. */
constexpr std::chrono::seconds SERVER_WAIT_DFLT{10};

/**
 * What the server does with one request. A plain answer is sent when the whole request has
 * arrived, and the connection stays open for the next one. The modifiers return a changed copy:
 *
 *     Answer::status(503).onHead().thenClose()
 */
class Answer {
  public:
    /** A complete answer with `Content-Length`. */
    static Answer status(int code, const Headers& headers = {}, const std::string& body = "");
    /** These bytes, whatever they are. */
    static Answer raw(const std::string& bytes);
    /** Reads the request and never says a word; the connection stays open. */
    static Answer never();
    /** Closes the connection in good order once the request has arrived, without an answer. */
    static Answer closing();
    /** Resets the connection once `bodyBytes` bytes of the body (chunks unpacked) are there. */
    static Answer resetAfter(std::size_t bodyBytes);

    /** Acts as soon as the head of the request is there; the body is read afterwards. */
    Answer onHead() const;
    /** Acts as soon as `count` bytes of the body are there; the rest is read afterwards. */
    Answer afterBodyBytes(std::size_t count) const;
    /** Stops reading the request as soon as the head is there, until `release` is called. */
    Answer notReading() const;
    /** Closes the connection in good order after the answer. */
    Answer thenClose() const;
    /** Resets the connection after the answer. */
    Answer thenReset() const;
    /** Sends nothing before `ScriptedHttpServer::release` lets it. */
    Answer held() const;
    /** Cuts the bytes into pieces of `size` bytes, each of which waits for a `release`. */
    Answer inPieces(std::size_t size) const;
    /** Reads the body in pieces of `size` bytes, each of which waits for a `release`. */
    Answer readingInPieces(std::size_t size) const;

  private:
    friend class ScriptedHttpServer;
    enum class End { KEEP, CLOSE, RESET };
    static constexpr std::size_t WHOLE_BODY = std::numeric_limits<std::size_t>::max();

    std::vector<std::string> pieces;
    std::size_t actAfter = WHOLE_BODY;
    bool needsRelease = false;
    bool pauseReading = false;
    std::size_t readAtOnce = 0;
    End end = End::KEEP;
};

/**
 * The server: one thread accepts, one per connection follows the script. Answers are taken from the
 * script in the order in which the heads of requests arrive, over all connections; after the
 * script, each request gets the default answer (200 with an empty body).
 *
 * All operations may be called from any thread. The wait operations return false when the time is
 * over. The destructor ends every connection and joins all threads.
 */
class ScriptedHttpServer {
  public:
    /** What arrived, byte for byte. */
    struct Request {
        std::size_t connection = 0;          /**< which connection, counted from 0 */
        std::string head;                    /**< from the method to the empty line, with it */
        std::string body;                    /**< chunks unpacked */
        std::vector<std::size_t> chunkSizes; /**< of a chunked body, without the last (0) */
        bool complete = false;               /**< the body's end has arrived */

        /** The first line, without its end. */
        std::string line() const;
        /** The value of a header; names are compared without regard to case. */
        std::optional<std::string> header(const std::string& name) const;
    };

    /** @param fixedPort the port to listen on, such as that of a server that has gone; 0: any */
    explicit ScriptedHttpServer(unsigned short fixedPort = 0);
    ~ScriptedHttpServer();
    ScriptedHttpServer(const ScriptedHttpServer&) = delete;
    ScriptedHttpServer& operator=(const ScriptedHttpServer&) = delete;

    unsigned short getPort() const { return port; }
    /** "http://127.0.0.1:PORT" */
    std::string getUrl() const;

    /** Appends answers to the script. */
    void script(const std::vector<Answer>& answers);
    void setDefaultAnswer(const Answer& answer);

    /** Lets `count` held answers or pieces go, now or as soon as they come up. */
    void release(std::size_t count = 1);

    /** Resets each of the next `count` connections as soon as it is there. */
    void resetConnections(std::size_t count);

    /** Resets the connections that are open; new ones are welcome. */
    void dropConnections();

    /** Resets all connections and refuses new ones until `comeBack`; the port stays taken. */
    void goAway();
    void comeBack();

    /**
     * Keeps the buffers of the system for connections small, which otherwise take megabytes that
     * the server never reads. To be called before the first connection.
     */
    void narrow();

    /** Requests so far, in the order of their heads. */
    std::size_t getRequestCount() const;
    /** A copy of request `index` as far as it has arrived; an empty one beyond the last. */
    Request getRequest(std::size_t index) const;
    /** Connections accepted so far. */
    std::size_t getConnectionCount() const;

    /**
     * True when the server has nothing to do: every thread waits for the peer or for `release`,
     * nothing has arrived that is not read, and all that was sent is in the peer's hands.
     */
    bool isIdle() const;
    /** Changes with everything that the server does or sees. */
    std::size_t getActivity() const;
    /** The peers' ports of open connections, and whether each is held until `release`. */
    std::map<unsigned short, bool> getPeers() const;

    /** Waits until `count` requests have arrived completely. */
    bool waitForRequest(std::size_t count,
                        std::chrono::milliseconds timeout = SERVER_WAIT_DFLT) const;
    /** Waits until the heads of `count` requests have arrived. */
    bool waitForHead(std::size_t count, std::chrono::milliseconds timeout = SERVER_WAIT_DFLT) const;
    /** Waits until at least `bytes` bytes of the body of request `index` have arrived. */
    bool waitForBody(std::size_t index, std::size_t bytes,
                     std::chrono::milliseconds timeout = SERVER_WAIT_DFLT) const;
    /** Waits until `count` connections have ended, by either side. */
    bool waitForClosed(std::size_t count,
                       std::chrono::milliseconds timeout = SERVER_WAIT_DFLT) const;

  private:
    class Connection;

    /** One connection, as the other threads see it. */
    struct Peer {
        int socket = -1;
        unsigned short port = 0;
        bool listens = false; /**< its thread waits for bytes */
        bool isHeld = false;  /**< its thread waits for `release` */
    };

    void acceptLoop();
    bool waitForConnection();
    void welcome(int socket, unsigned short peerPort);
    void serve(std::size_t index, int socket);
    void setListens(std::size_t connection, bool value);
    std::size_t addRequest(std::size_t connection, const std::string& head, Answer& answer);
    template <typename Change>
    void changeRequest(std::size_t index, Change change);
    bool waitForRelease(std::size_t connection);
    bool isQuiet(const Peer& peer) const;
    void resetAll();
    template <typename Condition>
    bool waitUntil(std::chrono::milliseconds timeout, Condition condition) const;

    unsigned short port;
    int listener;
    mutable std::mutex mutex;
    mutable std::condition_variable changed;
    std::deque<Answer> answers;
    Answer defaultAnswer;
    std::vector<Request> requests;
    std::size_t accepted = 0;
    std::size_t ended = 0;
    std::size_t released = 0;
    std::size_t toReset = 0;
    std::size_t activity = 0;
    bool stopping = false;
    bool away = false;
    bool acceptorWaits = false;
    std::map<std::size_t, Peer> peers;
    std::vector<std::thread> workers;
    std::thread acceptor;
};

/** A loopback port that is taken and refuses every connection for the life of the object. */
class RefusingPort {
  public:
    RefusingPort();
    ~RefusingPort();
    RefusingPort(const RefusingPort&) = delete;
    RefusingPort& operator=(const RefusingPort&) = delete;

    unsigned short getPort() const { return port; }
    std::string getUrl() const;

  private:
    unsigned short port = 0;
    int socket;
};

}  // namespace TestSupport
