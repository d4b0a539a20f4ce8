#pragma once

#include <map>
#include <string>

namespace korvel_pal {

/** The virtual roots and the directories for which they stand. Not synchronised. */
class MountTable {
  public:
    MountTable();

    /** With a null `directory` the root stays virtual, and nothing below it can be opened. */
    void mount(const std::string& root, const char* directory);

    /**
     * Replaces the longest virtual root at the path's beginning by its directory.
     * @return false when that root is not mounted
     */
    bool resolve(std::string& path) const;

  private:
    std::map<std::string, std::string> directories;  // empty: not mounted
};

}  // namespace korvel_pal
