#include "core/network/NetworkTask.h"

namespace Network {

NetworkTask::NetworkTask() = default;

NetworkTask::~NetworkTask() = default;

int NetworkTask::getPriority() const {
    return 1;
}

bool NetworkTask::needToGatherStatistics() const {
    return true;
}

bool NetworkTask::recieveResponseBodyByParts() const {
    return false;
}

void NetworkTask::onRetried() {}

const std::string& NetworkTask::getFailureReason() const {
    return failureReason;
}

}  // namespace Network
