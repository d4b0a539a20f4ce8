#pragma once

#include <string>

namespace Cli {

/**
 * Makes the network layer trust the certificate authorities of a PEM file beside the system's.
 * @throws UsageError if the file cannot be read or holds no certificate
 */
void trustAuthoritiesOf(const std::string& path);

}  // namespace Cli
