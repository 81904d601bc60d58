#include "layers/files/detail/PathChain.hpp"

#include <sys/stat.h>

#include <deque>
#include <system_error>

namespace velkor::layers::detail {

namespace {

constexpr int mostLinks = 40;  // as for the system

bool isSame(const PathChain::Step& left, const PathChain::Step& right) {
    return left.device == right.device && left.inode == right.inode && left.name == right.name &&
           left.folder == right.folder;
}

}  // namespace

// The names that are still to be looked up, and where.
class PathChain::Walk {
public:
    explicit Walk(PathChain& found) : chain(found) { goToRoot(); }

    // Puts the names of `path` before those that are left.
    void insert(const std::filesystem::path& path) {
        const std::filesystem::path names = path.relative_path();
        left.insert(left.begin(), names.begin(), names.end());
        if (path.is_absolute()) goToRoot();
    }

    // Takes one step. Whether there is another one.
    bool advance() {
        const std::string name = left.front();
        left.pop_front();
        if (name.empty() || name == ".") return !left.empty();
        if (name == "..") {
            goTo(folder.parent_path());
            return !left.empty();
        }
        return lookUp(name);
    }

private:
    bool lookUp(const std::string& name) {
        chain.way.push_back({folder.string(), name, status.st_dev, status.st_ino});
        const std::filesystem::path place = folder / name;
        struct stat found {};
        if (::lstat(place.c_str(), &found) != 0) return false;
        if (S_ISLNK(found.st_mode)) return follow(place);
        if (S_ISDIR(found.st_mode)) goTo(place);
        if (S_ISREG(found.st_mode) && left.empty()) {
            chain.target = place.string();
            chain.targetDevice = found.st_dev;
            chain.targetInode = found.st_ino;
        }
        return S_ISDIR(found.st_mode) && !left.empty();
    }

    bool follow(const std::filesystem::path& link) {
        std::error_code gone;
        const std::filesystem::path leadsTo = std::filesystem::read_symlink(link, gone);
        if (gone || ++links > mostLinks) return false;
        insert(leadsTo);
        return !left.empty();
    }

    void goToRoot() { goTo("/"); }

    void goTo(const std::filesystem::path& place) {
        folder = place;
        // What can't be asked has gone: the next look-up finds nothing.
        if (::lstat(folder.c_str(), &status) != 0) status = {};
    }

    PathChain& chain;
    std::deque<std::filesystem::path> left;
    std::filesystem::path folder;
    struct stat status {};
    int links = 0;
};

PathChain::PathChain(const std::filesystem::path& path) {
    Walk walk(*this);
    walk.insert(path);
    while (walk.advance()) continue;
}

bool operator==(const PathChain& left, const PathChain& right) {
    if (left.way.size() != right.way.size() || left.target != right.target) return false;
    for (std::size_t i = 0; i < left.way.size(); ++i) {
        if (!isSame(left.way[i], right.way[i])) return false;
    }
    return left.targetDevice == right.targetDevice && left.targetInode == right.targetInode;
}

}  // namespace velkor::layers::detail
