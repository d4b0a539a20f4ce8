#include "core/network/NetworkManager.h"

#include <atomic>
#include <boost/make_shared.hpp>
#include <mutex>

#include "core/network/NetworkInterfaces.h"
#include "network/curl/CurlTransport.h"

namespace Network {

class NetworkManager::Impl {
  public:
    static constexpr int NO_OVERRIDE = -1;

    std::atomic<int> override{NO_OVERRIDE};
    std::mutex mutex;
    boost::shared_ptr<Transport> transport = boost::make_shared<CurlTransport>();
};

NetworkManager& NetworkManager::getInstance() {
    return instance();
}

NetworkManager::NetworkManager() : impl(new Impl) {}

NetworkManager::~NetworkManager() {
    impl->transport->stop();
}

int NetworkManager::getReachability() const {
    const int word = impl->override;
    if (word != Impl::NO_OVERRIDE) {
        return word;
    }
    const auto interfaces = listNetworkInterfaces();
    return interfaces ? judgeReachability(*interfaces) : METERED;
}

void NetworkManager::overrideReachability(int value) {
    impl->override = value;
}

void NetworkManager::setCertificateFile(const std::string& path) {
    getTransport()->setCertificateFile(path);
}

boost::shared_ptr<Transport> NetworkManager::getTransport() const {
    const std::lock_guard<std::mutex> lock(impl->mutex);
    return impl->transport;
}

void NetworkManager::setTransport(const boost::shared_ptr<Transport>& transport) {
    boost::shared_ptr<Transport> previous =
        transport ? transport : boost::make_shared<CurlTransport>();
    {
        const std::lock_guard<std::mutex> lock(impl->mutex);
        previous.swap(impl->transport);
    }
    previous->stop();
}

}  // namespace Network
