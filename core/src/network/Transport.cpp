#include "core/network/Transport.h"

namespace Network {

TransferListener::~TransferListener() = default;
Transfer::~Transfer() = default;
Transport::~Transport() = default;

}  // namespace Network
