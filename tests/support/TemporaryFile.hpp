#pragma once

#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>

#include <fcntl.h>
#include <unistd.h>

namespace velkor::testing {

/// A file with the given bytes in a folder of its own; both are gone when this is destroyed.
/// Written without C++ streams, so no locale has a say in its content.
class TemporaryFile {
public:
    explicit TemporaryFile(std::string_view content, const std::string& name = "file.properties")
        : folder(makeFolder()), file(folder / name) {
        rewrite(content);
    }

    ~TemporaryFile() {
        std::error_code leftBehind;
        std::filesystem::remove_all(folder, leftBehind);
    }

    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    /// Replaces the content. The file is cut to its size at the end and not emptied first: some
    /// file systems write a file that was emptied out to the disk at once.
    void rewrite(std::string_view content) const {
        const int descriptor = ::open(file.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
        if (descriptor < 0) throw std::runtime_error("can't create " + file.string());
        std::string_view rest = content;
        while (!rest.empty()) {
            const auto written = ::write(descriptor, rest.data(), rest.size());
            if (written <= 0) break;
            rest.remove_prefix(static_cast<std::size_t>(written));
        }
        const bool isCut = ::ftruncate(descriptor, static_cast<off_t>(content.size())) == 0;
        ::close(descriptor);
        if (!rest.empty() || !isCut) throw std::runtime_error("can't write " + file.string());
    }

    const std::filesystem::path& path() const { return file; }

    /// The folder that holds nothing but the file.
    const std::filesystem::path& parent() const { return folder; }

    std::u16string widePath() const { return file.u16string(); }

private:
    static std::filesystem::path makeFolder() {
        std::string name = (std::filesystem::temp_directory_path() / "velkor-XXXXXX").string();
        if (::mkdtemp(name.data()) == nullptr) throw std::runtime_error("can't create " + name);
        return name;
    }

    std::filesystem::path folder;
    std::filesystem::path file;
};

}  // namespace velkor::testing
