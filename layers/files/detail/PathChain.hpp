#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>
#include <vector>

namespace velkor::layers::detail {

/// The way that the system goes to a file: every name along the path and along the target of each
/// link, with the folder that it is looked up in. Ends at the file, or at the first name that isn't
/// there: whoever watches all the folders notices when the path begins to lead elsewhere.
class PathChain {
public:
    struct Step {
        std::string folder;  ///< Without links.
        std::string name;
        dev_t device = 0;  ///< Of the folder, with its inode.
        ino_t inode = 0;
    };

    /// No way at all.
    PathChain() = default;

    /// Goes the way of `path`, which is absolute, as it is now.
    explicit PathChain(const std::filesystem::path& path);

    /// From the root on.
    const std::vector<Step>& steps() const { return way; }

    /// The regular file at the end, without links; empty if there is none.
    const std::string& file() const { return target; }

    /// Whether both are the same way over the same folders to the same file.
    friend bool operator==(const PathChain& left, const PathChain& right);
    friend bool operator!=(const PathChain& left, const PathChain& right) {
        return !(left == right);
    }

private:
    class Walk;

    std::vector<Step> way;
    std::string target;
    dev_t targetDevice = 0;
    ino_t targetInode = 0;
};

}  // namespace velkor::layers::detail
