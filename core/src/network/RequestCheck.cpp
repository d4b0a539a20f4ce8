#include "network/RequestCheck.h"

#include <string>

#include "pal/kd_log.h"

namespace Network {

namespace {

std::string findFault(const HttpRequest& request) {
    const std::string urlFault = HttpRequest::findUrlFault(request.getUrl());
    if (!urlFault.empty()) {
        return "its URL " + urlFault;
    }
    if (request.getMethod() != "GET" && request.getMethod() != "POST") {
        return "its method is neither GET nor POST";
    }
    const bool hasBody = request.isChunked() || !request.getBody().empty();
    if (hasBody && request.getMethod() == "GET") {
        return "GET with a body";
    }
    if (request.isChunked() && !request.getWriter()) {
        return "nobody writes its body";
    }
    return "";
}

}  // namespace

bool canBeSent(const boost::shared_ptr<HttpRequest>& request) {
    const std::string fault = request ? findFault(*request) : "there is none";
    if (!fault.empty()) {
        kdLogFormatMessage("Network: a request cannot be sent: %s", fault.c_str());
    }
    return fault.empty();
}

}  // namespace Network
