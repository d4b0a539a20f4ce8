#include "mount_table.h"

namespace korvel_pal {

MountTable::MountTable() {
    mount("/removable", nullptr);
}

void MountTable::mount(const std::string& root, const char* directory) {
    directories[root] = directory != nullptr ? directory : "";
}

bool MountTable::resolve(std::string& path) const {
    if (path.empty() || path[0] != '/') {
        return true;
    }
    for (std::string root = path; !root.empty(); root.resize(root.rfind('/'))) {
        const auto found = directories.find(root);
        if (found != directories.end()) {
            path.replace(0, root.size(), found->second);
            return !found->second.empty();
        }
    }
    return true;
}

}  // namespace korvel_pal
