#include "core/network/NetworkManager.h"

#include <atomic>
#include <boost/make_shared.hpp>

#include "core/network/NetworkInterfaces.h"
#include "network/Transport.h"

namespace Network {

class NetworkManager::Impl {
  public:
    static constexpr int NO_OVERRIDE = -1;

    const boost::shared_ptr<Transport> transport = boost::make_shared<Transport>();
    std::atomic<int> override{NO_OVERRIDE};
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
    impl->transport->setCertificateFile(path);
}

Transport& NetworkManager::getTransport() {
    return *impl->transport;
}

}  // namespace Network
