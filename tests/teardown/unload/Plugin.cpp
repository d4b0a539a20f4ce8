// Part of an application that is loaded while it runs, and goes again: a session whose recorder
// hangs, and a usage log whose name server is silent.
#include <boost/make_shared.hpp>

#include "core/network/NetworkManager.h"
#include "logcollector/LogCollector.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

const char* const UUID = "0123456789abcdef0123456789abcdef";

boost::shared_ptr<Talvox::RecognizerListener> listener;
boost::shared_ptr<Talvox::Recognizer> session;

}  // namespace

extern "C" __attribute__((visibility("default"))) void begin(const char* url) {
    const auto settings = boost::make_shared<Talvox::Settings>();
    settings->putString(Talvox::Settings::SKS_UUID, UUID);
    settings->putString(Talvox::Settings::SKS_URL, url);
    Talvox::Talvox& engine = Talvox::Talvox::getInstance();
    engine.setTalvoxSettings(settings);
    Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::WIFI);
    listener = boost::make_shared<Talvox::RecognizerListenerAdapter>();
    session = engine.createRecognizer(listener, boost::make_shared<Talvox::Settings>());
    session->start();
    LogCollector::setLoggingEnabled(true);
    LogCollector::configure(UUID, url);
    LogCollector::startSession("main");
    LogCollector::logEvent("main", "begun", {});
}

extern "C" __attribute__((visibility("default"))) void end() {
    session.reset();
    listener.reset();
}
