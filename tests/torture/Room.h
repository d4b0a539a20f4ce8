/**
 * @file
 * Little room for files, by the system itself.
 */
#pragma once

#include <string>

#include "Order.h"

namespace Torture {

/**
 * While it lives, files of this process have room for a few pages: on a file system of that size
 * (in a mount namespace of this process), or by the process's limit where no file system can be
 * mounted. Does nothing for orders of other kinds.
 */
class Room {
  public:
    Room(const Order& order, Report& report);
    ~Room();
    Room(const Room&) = delete;
    Room& operator=(const Room&) = delete;

  private:
    bool mountSmall(const std::string& options);
    void limitFiles(long bytes);

    const char* const directory;
    bool isMounted = false;
    bool isLimited = false;
};

/**
 * Reads the dump of a session.
 * @param isWhole the file must hold what a whole session writes
 * @return what its header says wrongly; empty when it tells the truth
 */
std::string findDumpFault(const std::string& path, bool isWhole);

}  // namespace Torture
