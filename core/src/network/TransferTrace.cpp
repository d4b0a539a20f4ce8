#include "core/network/TransferTrace.h"

namespace Network {

TransferTrace::~TransferTrace() = default;
TransferTap::~TransferTap() = default;

}  // namespace Network
