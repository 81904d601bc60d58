#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <filesystem>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {

/// A file that is open for writing, as a slow writer has it.
class OpenFile {
public:
    OpenFile(const std::filesystem::path& path, int flags)
        : descriptor(::open(path.c_str(), O_WRONLY | O_CLOEXEC | flags, 0600)) {
        if (descriptor < 0) throw std::runtime_error("can't open " + path.string());
    }
    ~OpenFile() { ::close(descriptor); }

    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    void write(std::string_view text) const {
        if (::write(descriptor, text.data(), text.size()) != static_cast<ssize_t>(text.size())) {
            throw std::runtime_error("can't write");
        }
    }

private:
    const int descriptor;
};

/// A folder that is gone in the end, and what people do to files in it.
class FileFolder {
public:
    std::filesystem::path operator/(const std::string& name) const { return kept.parent() / name; }

    /// Empties the file, or makes it, and writes it.
    static void write(const std::filesystem::path& path, std::string_view text) {
        const OpenFile file(path, O_CREAT | O_TRUNC);
        file.write(text);
    }

    /// Writes another file and renames it.
    static void replace(const std::filesystem::path& path, std::string_view text) {
        const auto other = path.string() + ".new";
        write(other, text);
        std::filesystem::rename(other, path);
    }

    /// Lets the link at `path` lead to `target` without a moment in which there is none.
    static void relink(const std::filesystem::path& path, const std::filesystem::path& target) {
        const auto other = path.string() + ".new";
        std::filesystem::create_symlink(target, other);
        std::filesystem::rename(other, path);
    }

private:
    TemporaryFile kept{"", "kept"};
};

}  // namespace velkor::testing
