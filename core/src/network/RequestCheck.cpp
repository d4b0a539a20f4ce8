#include "network/RequestCheck.h"

namespace Network {

namespace {

std::string findFaultIn(const HttpRequest& request) {
    if (!request.getRefusal().empty()) {
        return request.getRefusal();
    }
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

std::string findFault(const boost::shared_ptr<HttpRequest>& request) {
    return request ? findFaultIn(*request) : "there is none";
}

}  // namespace Network
