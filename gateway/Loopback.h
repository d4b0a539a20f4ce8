#pragma once

#include <string>

struct sockaddr;

namespace Gateway {

/** Whether only programs of this machine reach an address. */
bool isLoopback(const sockaddr& address);

/**
 * Whether the value of a Host header names the loopback interface: "localhost", or an address, with
 * or without a port. A page of another site can reach a loopback address under a name of its own,
 * but then it is this name that the browser sends.
 */
bool namesLoopback(const std::string& host);

}  // namespace Gateway
