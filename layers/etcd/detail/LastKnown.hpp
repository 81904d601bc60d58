#pragma once

#include <cstdint>
#include <filesystem>
#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::layers::etcd {

/// A point in the history of a cluster up to which everything has been seen.
struct Position {
    std::string cluster{};
    std::int64_t revision = 0;

    /// A key and the revision of its last change by then, 0 where it wasn't there: another history
    /// doesn't have that.
    std::string witness{};
    std::int64_t witnessModified = 0;
};

/// The values of a server as they were last known.
struct LastKnown {
    Position position{};
    configuration::ValueMap values{};
};

/// Replaces `file` by one that holds `content`, of the keys that `prefix` begins: it is that or
/// what it was, whatever happens meanwhile. Throws `std::runtime_error` with the path and the
/// reason.
void writeLastKnown(const std::filesystem::path& file, const std::string& prefix,
                    const LastKnown& content);

/// What `writeLastKnown` has written. Throws `std::runtime_error` with the path and the reason:
/// there is none, it is damaged, or of another prefix.
LastKnown readLastKnown(const std::filesystem::path& file, const std::string& prefix);

}  // namespace velkor::layers::etcd
