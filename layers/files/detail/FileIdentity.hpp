#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <filesystem>
#include <optional>

namespace velkor::layers::detail {

/// What tells one state of a file from another without reading it.
struct FileIdentity {
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    std::int64_t seconds = 0;  ///< When it was written last, with the nanoseconds.
    std::int64_t nanoseconds = 0;

    explicit FileIdentity(const struct stat& status)
        : device(status.st_dev),
          inode(status.st_ino),
          size(status.st_size),
          seconds(status.st_mtim.tv_sec),
          nanoseconds(status.st_mtim.tv_nsec) {}

    friend bool operator==(const FileIdentity& left, const FileIdentity& right) {
        return left.device == right.device && left.inode == right.inode &&
               left.size == right.size && left.seconds == right.seconds &&
               left.nanoseconds == right.nanoseconds;
    }
    friend bool operator!=(const FileIdentity& left, const FileIdentity& right) {
        return !(left == right);
    }
};

/// The identity of what `path` leads to; nothing if that is nowhere.
inline std::optional<FileIdentity> identityOf(const std::filesystem::path& path) {
    struct stat status {};
    if (::stat(path.c_str(), &status) != 0) return std::nullopt;
    return FileIdentity(status);
}

}  // namespace velkor::layers::detail
