#include <sys/types.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <exception>
#include <memory>
#include <mutex>
#include <string>

#include "handle_table.h"
#include "immortal.h"
#include "mount_table.h"
#include "pal/kd_file.h"
#include "pal/kd_log.h"

namespace {

using korvel_pal::HandleTable;
using korvel_pal::MountTable;

struct OpenFile {
    ~OpenFile() {
        if (file != nullptr) {
            std::fclose(file);
        }
    }

    std::mutex mutex;
    std::FILE* file = nullptr;  // null once closed
};

struct FileSystem {
    std::mutex mutex;
    MountTable mounts;
    HandleTable<KDFile, std::shared_ptr<OpenFile>> files;
};

FileSystem& fileSystem() {
    static korvel_pal::Immortal<FileSystem> system;
    return system.get();
}

std::shared_ptr<OpenFile> findFile(const KDFile* handle) {
    FileSystem& system = fileSystem();
    const std::lock_guard<std::mutex> lock(system.mutex);
    const std::shared_ptr<OpenFile>* const found = system.files.find(handle);
    return found != nullptr ? *found : nullptr;
}

/** Calls `use(FILE*)` while nobody can close the file; a handle that is not live gives `failed`. */
template <typename Result, typename Use>
Result withFile(const KDFile* handle, Result failed, Use use) {
    const std::shared_ptr<OpenFile> open = findFile(handle);
    if (open == nullptr) {
        return failed;
    }
    const std::lock_guard<std::mutex> lock(open->mutex);
    return open->file != nullptr ? use(open->file) : failed;
}

bool fitsInMemory(KDsize size, KDsize count) {
    return count == 0 || size <= SIZE_MAX / count;
}

}  // namespace

namespace {

KDFile* openFile(std::string path, const char* mode) {
    FileSystem& system = fileSystem();
    {
        const std::lock_guard<std::mutex> lock(system.mutex);
        if (!system.mounts.resolve(path)) {
            return nullptr;
        }
    }
    const auto open = std::make_shared<OpenFile>();
    open->file = std::fopen(path.c_str(), mode);
    if (open->file == nullptr) {
        return nullptr;
    }
    if (std::strpbrk(mode, "wa+") != nullptr) {
        // What a write returns is what the file has, also when the disk is full.
        std::setvbuf(open->file, nullptr, _IONBF, 0);
    }
    const std::lock_guard<std::mutex> lock(system.mutex);
    return system.files.add(open);
}

}  // namespace

KDFile* kdFopen(const char* pathname, const char* mode) {
    if (pathname == nullptr || mode == nullptr) {
        return nullptr;
    }
    try {
        return openFile(pathname, mode);
    } catch (const std::exception&) {
        kdLogMessage("PAL: no memory to open a file");
        return nullptr;
    }
}

KDint kdFclose(KDFile* file) {
    return withFile<KDint>(file, -1, [file](std::FILE*& stream) {
        FileSystem& system = fileSystem();
        {
            const std::lock_guard<std::mutex> lock(system.mutex);
            system.files.remove(file);
        }
        std::FILE* const closing = stream;
        stream = nullptr;
        return std::fclose(closing) == 0 ? 0 : -1;
    });
}

KDsize kdFread(void* buffer, KDsize size, KDsize count, KDFile* file) {
    if (buffer == nullptr || !fitsInMemory(size, count)) {
        return 0;
    }
    return withFile<KDsize>(file, 0, [buffer, size, count](std::FILE* stream) {
        return std::fread(buffer, size, count, stream);
    });
}

KDsize kdFwrite(const void* buffer, KDsize size, KDsize count, KDFile* file) {
    if (buffer == nullptr || !fitsInMemory(size, count)) {
        return 0;
    }
    return withFile<KDsize>(file, 0, [buffer, size, count](std::FILE* stream) {
        return std::fwrite(buffer, size, count, stream);
    });
}

KDint kdFseek(KDFile* file, KDint64 offset, KDfileSeekOrigin origin) {
    int whence = SEEK_SET;
    if (origin == KD_SEEK_CUR) {
        whence = SEEK_CUR;
    } else if (origin == KD_SEEK_END) {
        whence = SEEK_END;
    } else if (origin != KD_SEEK_SET) {
        return -1;
    }
    const auto systemOffset = static_cast<off_t>(offset);
    if (systemOffset != offset) {
        return -1;
    }
    return withFile<KDint>(file, -1, [systemOffset, whence](std::FILE* stream) {
        return fseeko(stream, systemOffset, whence) == 0 ? 0 : -1;
    });
}

KDint kdMountKOR(const char* virtualRoot, const char* directory) {
    try {
        const std::string root(virtualRoot != nullptr ? virtualRoot : "");
        if (root.empty() || root.front() != '/' || root.back() == '/') {
            return -1;
        }
        FileSystem& system = fileSystem();
        const std::lock_guard<std::mutex> lock(system.mutex);
        system.mounts.mount(root, directory);
        return 0;
    } catch (const std::exception&) {
        kdLogMessage("PAL: no memory for a mount");
        return -1;
    }
}
