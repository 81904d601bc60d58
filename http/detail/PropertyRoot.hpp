#pragma once

#include <cstdint>
#include <string>

#include "http/detail/Descriptor.hpp"

namespace velkor::http::detail {

/// The folder that clients may name property files in. They are read here, so that the system's
/// rights are not all that stands between a client and a file.
///
/// Immutable: safe for concurrent use.
class PropertyRoot {
public:
    /// The folder at `path`, as long as it lives, wherever that is moved to; files of more than
    /// `mostFileBytes` are not read. Throws `Refused` "can't use the property root PATH:
    /// REASON", the reason being the system's.
    PropertyRoot(const std::string& path, std::uintmax_t mostFileBytes);

    /// The content of the regular file at `path`, which is absolute or begins at the root. A path
    /// that leads out of the root as it is written is not even looked up, and one that leads out by
    /// links is not read: what is compared is the place of the file that is open, so that nobody
    /// can change it in between. Only regular files are opened for reading.
    ///
    /// Throws `std::runtime_error`:
    /// - "Property file not allowed: " and `path`: the file is not below the root;
    /// - "Property file could not be opened: ", `path`, ": " and the reason, which is the system's,
    ///   "Not a regular file", or "Larger than N bytes".
    std::string read(const std::string& path) const;

private:
    const Descriptor root;
    const std::string name;
    const std::uintmax_t mostBytes;
};

}  // namespace velkor::http::detail
