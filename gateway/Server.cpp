#include "gateway/Server.h"

#include <microhttpd.h>
#include <netdb.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include <cerrno>
#include <cstring>
#include <exception>

#include "gateway/HttpExchange.h"
#include "gateway/Loopback.h"
#include "pal/kd_log.h"

namespace Gateway {

namespace {

/** Room for a request's headers and for an answer's, of which the results may be 90 KB. */
constexpr std::size_t CONNECTION_MEMORY_BYTES = std::size_t{1024} * 1024;
constexpr unsigned MAX_CONNECTIONS = 64;

/** Handles the head, each piece of the body, and its end. @return false to close the connection */
bool handle(Server& server, MHD_Connection* connection, const char* url, const char* method,
            const char* data, std::size_t* size, void** state) {
    if (*state == nullptr) {
        auto* const begun = new HttpExchange(server, connection, url, method);
        *state = begun;
        return begun->onHead();
    }
    auto* const exchange = static_cast<HttpExchange*>(*state);
    if (*size == 0) {
        return exchange->onEnd();
    }
    const std::size_t count = *size;
    *size = 0;
    return exchange->onBody(data, count);
}

/** Costs a client its connection, not everybody the gateway, when memory runs out. */
MHD_Result onRequest(void* user, MHD_Connection* connection, const char* url, const char* method,
                     const char* /*version*/, const char* data, std::size_t* size, void** state) {
    try {
        Server& server = *static_cast<Server*>(user);
        return handle(server, connection, url, method, data, size, state) ? MHD_YES : MHD_NO;
    } catch (const std::exception& failure) {
        kdLogFormatMessage("a request was given up: %s", failure.what());
        return MHD_NO;
    }
}

void onCompleted(void* /*user*/, MHD_Connection* /*connection*/, void** state,
                 MHD_RequestTerminationCode /*code*/) {
    auto* exchange = static_cast<HttpExchange*>(*state);
    if (exchange != nullptr) {
        exchange->onCompleted();
        delete exchange;
        *state = nullptr;
    }
}

/** Query values stay coded: zero bytes would end them, and mistakes in them would not show. */
std::size_t leaveCoded(void* /*user*/, MHD_Connection* /*connection*/, char* text) {
    return std::strlen(text);
}

/** The library's messages: of interest to who asked for everything. */
__attribute__((format(printf, 2, 0))) void onLibraryMessage(void* user, const char* format,
                                                            va_list arguments) {
    if (static_cast<Server*>(user)->getOptions().verbose) {
        kdLogFormatMessageVargs(format, arguments);
    }
}

struct AddressList {
    ~AddressList() {
        if (first != nullptr) {
            freeaddrinfo(first);
        }
    }
    addrinfo* first = nullptr;
};

}  // namespace

Server::Server(const ServerOptions& serverOptions)
    : options(serverOptions),
      pool(options.model, options.decoders, options.decoderWaitMs),
      sessions(options.hasPage ? std::make_unique<SessionList>() : nullptr) {}

Server::~Server() {
    stop();
}

std::string Server::start() {
    std::string problem = options.model.findProblem();
    if (!problem.empty()) {
        return problem;
    }
    std::string logProblem = recordLog.open(options.recordFile);
    if (!logProblem.empty()) {
        return logProblem;
    }
    if (!pool.load()) {
        return "the decoder does not accept the model";
    }
    addrinfo hints{};
    hints.ai_flags = AI_PASSIVE | AI_NUMERICSERV;
    hints.ai_socktype = SOCK_STREAM;
    AddressList addresses;
    const int failure = getaddrinfo(options.host.c_str(), std::to_string(options.port).c_str(),
                                    &hints, &addresses.first);
    if (failure != 0) {
        return "the address " + options.host + " is not known: " + gai_strerror(failure);
    }
    for (const addrinfo* it = addresses.first; it != nullptr; it = it->ai_next) {
        onLoopback = onLoopback && isLoopback(*it->ai_addr);
    }
    if (options.hasPage && !onLoopback) {
        return "the page shows what all clients say, so it needs a loopback address; " +
               options.host + " is none";
    }
    for (const addrinfo* it = addresses.first; it != nullptr && daemon == nullptr;
         it = it->ai_next) {
        listen(*it);
    }
    if (daemon == nullptr) {
        return "cannot listen on " + options.host + " port " + std::to_string(options.port) + ": " +
               std::strerror(errno);
    }
    const MHD_DaemonInfo* info = MHD_get_daemon_info(daemon, MHD_DAEMON_INFO_BIND_PORT);
    port = info == nullptr ? options.port : info->port;
    return std::string();
}

void Server::listen(const addrinfo& address) {
    unsigned flags = MHD_USE_THREAD_PER_CONNECTION | MHD_USE_INTERNAL_POLLING_THREAD |
                     MHD_USE_POLL | MHD_USE_ERROR_LOG;
    if (address.ai_family == AF_INET6) {
        flags |= MHD_USE_IPv6;
    }
    daemon = MHD_start_daemon(
        flags, options.port, nullptr, nullptr, &onRequest, this, MHD_OPTION_EXTERNAL_LOGGER,
        &onLibraryMessage, this, MHD_OPTION_UNESCAPE_CALLBACK, &leaveCoded, nullptr,
        MHD_OPTION_SOCK_ADDR, address.ai_addr, MHD_OPTION_CONNECTION_MEMORY_LIMIT,
        CONNECTION_MEMORY_BYTES, MHD_OPTION_CONNECTION_LIMIT, MAX_CONNECTIONS,
        MHD_OPTION_CONNECTION_TIMEOUT, options.idleSeconds, MHD_OPTION_NOTIFY_COMPLETED,
        &onCompleted, nullptr, MHD_OPTION_END);
}

void Server::stop() {
    pool.close();
    if (daemon != nullptr) {
        MHD_stop_daemon(daemon);
        daemon = nullptr;
    }
    recordLog.close();
}

std::string Server::getUrl() const {
    std::string host = options.host;
    if (host == "0.0.0.0") {
        host = "127.0.0.1";
    } else if (host == "::") {
        host = "::1";
    }
    if (host.find(':') != std::string::npos) {
        host = "[" + host + "]";
    }
    return "http://" + host + ":" + std::to_string(port);
}

}  // namespace Gateway
