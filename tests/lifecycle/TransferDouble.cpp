// One attempt of a request, which the scripted gateway serves instead of libcurl.
#include <algorithm>
#include <array>
#include <utility>

#include "ScriptedGateway.h"
#include "network/Transfer.h"
#include "network/Transport.h"

namespace Network {

Transfer::Transfer(boost::shared_ptr<Transport> owner, boost::shared_ptr<HttpRequest> what,
                   boost::shared_ptr<TransferListener> hearer)
    : transport(std::move(owner)),
      request(std::move(what)),
      listener(std::move(hearer)),
      watchdog(request->getTimeoutMs(),
               [this] {
                   if (const boost::shared_ptr<Transfer> self = weak_from_this().lock()) {
                       transport->requestCheck(self);
                   }
               }),
      body(request) {}

CURL* Transfer::open(const std::string& /*certificateFile*/) {
    const boost::shared_ptr<Transfer> self = shared_from_this();
    Lifecycle::ScriptedGateway::instance().connect(
        {self, listener, request->getUrl(), [this](std::string& received, std::size_t most) {
             std::array<char, 16384> piece;
             for (;;) {
                 const std::size_t room = std::min(piece.size(), most);
                 const std::size_t size = room > 0 ? readBody(piece.data(), room) : 0;
                 if (size == 0) {
                     return room > 0 && !paused;
                 }
                 received.append(piece.data(), size);
                 most -= size;
             }
         }});
    return nullptr;
}

/** @return 0 at the end of the body and, with `paused` set, when there is nothing yet */
std::size_t Transfer::readBody(char* data, std::size_t size) {
    std::size_t count = 0;
    paused = body.read(data, size, count) == RequestBody::State::NOTHING_YET;
    if (paused) {
        watchdog.pause();
    } else {
        watchdog.progress();
    }
    return count;
}

void Transfer::end(const TransferEnd& how) {
    const boost::shared_ptr<TransferListener> hearer = listener;
    abandon();
    if (hearer) {
        hearer->onTransferEnd(how);
    }
}

void Transfer::abandon() {
    watchdog.stop();
    listener.reset();
}

}  // namespace Network
