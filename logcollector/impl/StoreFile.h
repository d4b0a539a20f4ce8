/**
 * @file
 * The files of a store.
 */
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace LogCollector {

/** An open file, closed with its object; where an operation fails, `errno` says why. */
class StoreFile {
  public:
    StoreFile() = default;
    /** Opens a file, never through a symbolic link. @param flags as for `open` */
    StoreFile(const std::string& path, int flags);
    ~StoreFile();
    StoreFile(StoreFile&& other) noexcept;
    StoreFile& operator=(StoreFile&& other) noexcept;
    StoreFile(const StoreFile&) = delete;
    StoreFile& operator=(const StoreFile&) = delete;

    bool isOpen() const { return descriptor >= 0; }

    /** Writes all of the bytes, or says that it failed; some may have been written then. */
    bool write(std::string_view bytes, std::size_t offset) const;
    bool truncate(std::size_t size) const;

    /**
     * Takes the lock of this file, which no other process and no other object can have at the same
     * time, or fails at once. The system releases it with the object, and when the process ends,
     * however it ends. A child that was forked without `exec` has its share of it.
     */
    bool lock() const;

    /** The bytes of a file of at most `most` bytes, none where it cannot be read. */
    static std::optional<std::string> read(const std::string& path, std::size_t most);

  private:
    int descriptor = -1;
};

}  // namespace LogCollector
