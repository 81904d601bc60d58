#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>

#include "layers/files/detail/FileIdentity.hpp"

namespace velkor::layers::detail {

/// What came of reading a file.
struct FileReading {
    bool torn = false;  ///< The file changed meanwhile: nothing else here counts.
    std::optional<FileIdentity> identity{};  ///< Nothing: there is no file.
    std::string text{};
    std::string problem{};  ///< Why there is no text, with the path; empty if there is.
    bool wasOpened = false;
};

/// Reads the file at `path` as a whole. Waits for the disk, but for nobody who would write: what is
/// no regular file is not opened. The problems are
/// - "Property file could not be opened: PATH: REASON", REASON being the system's, or "Not a
/// regular
///   file";
/// - "Property file could not be read: PATH: REASON";
/// - "Property file is larger than N bytes: PATH".
FileReading readFile(const std::filesystem::path& path, std::uintmax_t mostBytes);

}  // namespace velkor::layers::detail
