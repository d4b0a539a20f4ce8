/**
 * @file
 * A directory that lasts as long as its object.
 */
#pragma once

#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <system_error>

namespace TestSupport {

/** An empty directory among the system's temporary files, removed with all that is in it. */
class ScratchDirectory {
  public:
    ScratchDirectory() {
        std::string pattern = (std::filesystem::temp_directory_path() / "talvox-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("cannot make " + pattern);
        }
        root = pattern;
    }
    ~ScratchDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(root, ignored);
    }
    ScratchDirectory(const ScratchDirectory&) = delete;
    ScratchDirectory& operator=(const ScratchDirectory&) = delete;

    /** The path of a file in the directory. */
    std::string path(const std::string& name) const { return root + "/" + name; }

  private:
    std::string root;
};

}  // namespace TestSupport
