#include "Address.h"

#include "Text.h"
#include "UsageError.h"
#include "core/network/HttpRequest.h"

namespace Cli {

namespace {

void refuseEmpty(const std::string& name, const std::string& text) {
    if (text.empty()) {
        throw UsageError("the " + name + " is empty");
    }
}

void refuseFault(const std::string& name, const std::string& text, const std::string& url) {
    const std::string fault = Network::HttpRequest::findUrlFault(url);
    if (!fault.empty()) {
        throw UsageError("the " + name + " \"" + printable(text) + "\" " + fault);
    }
}

}  // namespace

void checkUrl(const std::string& url) {
    refuseEmpty("address", url);
    refuseFault("address", url, url);
}

void checkQueryValue(const std::string& name, const std::string& text) {
    refuseFault(name, text, "http://127.0.0.1/?" + text);
}

void checkRequestSettings(const Talvox::Settings& settings) {
    checkUrl(settings.getUrl());
    refuseEmpty("uuid", settings.getUuid());
    checkQueryValue("uuid", settings.getUuid());
    refuseEmpty("language", settings.getLanguage());
    checkQueryValue("session identifier", settings.getSessionId());
}

}  // namespace Cli
