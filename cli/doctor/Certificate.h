#pragma once

#include <map>
#include <string>

namespace Cli {

/** What a server's certificate says, from the fields that the TLS library prints of it. */
struct Certificate {
    static Certificate read(const std::map<std::string, std::string>& fields);

    std::string issuer;
    std::string names;      /**< of the hosts that it is valid for, separated by commas */
    std::string expires;    /**< the date, as the TLS library prints it */
    bool hasExpiry = false; /**< the date could be read */
    long daysLeft = 0;      /**< whole days from now; negative once it has expired */
};

}  // namespace Cli
