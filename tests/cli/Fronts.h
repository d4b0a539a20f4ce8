/**
 * @file
 * Real proxies in front of gateways.
 */
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace TestSupport {

/** The files of docs/deploy. */
std::string deployFile(const std::string& name);

/** A loopback port that a program takes over, so that clients can connect before it is ready. */
class InheritedPort {
  public:
    InheritedPort();
    ~InheritedPort();
    InheritedPort(const InheritedPort&) = delete;
    InheritedPort& operator=(const InheritedPort&) = delete;

    int getDescriptor() const { return descriptor; }
    unsigned short getPort() const { return port; }

  private:
    int descriptor = -1;
    unsigned short port = 0;
};

/** nginx with one configuration file, which includes what is at the place. */
class Nginx {
  public:
    static bool isInstalled();

    /**
     * @param file     the configuration, a file for the folder conf.d
     * @param listen   what talvox/listen.conf has besides the address
     * @param gateways what talvox/gateways.conf has
     */
    Nginx(const std::string& file, const std::string& listen, const std::string& gateways);

    unsigned short getPort() const { return port; }

  private:
    ScratchDirectory directory;
    unsigned short port = 0;
    std::unique_ptr<ChildProcess> program;
};

/** haproxy with one configuration file. */
class Haproxy {
  public:
    static bool isInstalled();

    /**
     * @param certificate PEM file with certificate and key
     * @param gateways    ports of the gateways, the first one first
     */
    Haproxy(const std::string& file, const std::string& certificate,
            const std::vector<std::string>& gateways);

    unsigned short getPort() const { return port; }

    /** Sends a command to its administrative socket. @return the answer */
    std::string command(const std::string& text) const;

  private:
    ScratchDirectory directory;
    unsigned short port = 0;
    std::unique_ptr<ChildProcess> program;
};

}  // namespace TestSupport
