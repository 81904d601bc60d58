#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <unordered_map>
#include <vector>

#include "benchmarks/fleet/WatchProcess.hpp"

namespace velkor::benchmarks {

/// What etcd has been told, as etcd itself says: each value of each setting in the order of
/// revisions.
class History {
public:
    explicit History(const std::vector<Seen>& changes);

    /// The place of a value in that order, which is not the revision but grows with it.
    std::optional<std::size_t> place(int key, int value) const;

    /// The last values, those of settings that were never written left out.
    const std::map<int, int>& values() const noexcept { return last; }

    /// Values that stand there more than once.
    const std::vector<int>& repeated() const noexcept { return twice; }

    std::size_t size() const noexcept { return places.size(); }

private:
    struct Entry {
        int key;
        std::size_t place;
    };
    std::unordered_map<int, Entry> places;
    std::map<int, int> last;
    std::vector<int> twice;
};

}  // namespace velkor::benchmarks
