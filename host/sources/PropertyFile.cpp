#include "host/sources/PropertyFile.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstddef>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include "configuration/StoreErrors.hpp"

namespace velkor::host {

namespace {

constexpr const char* fileNotRead = "Property file could not be read: ";

[[noreturn]] void fail(const char* text, const std::string& path, int reason) {
    throw std::runtime_error(text + path + ": " + std::system_category().message(reason));
}

/// A file that is open for reading.
class OpenFile {
public:
    explicit OpenFile(const std::string& path) : descriptor(openedAt(path)) {
        if (descriptor < 0) fail(configuration::store_errors::fileNotOpened, path, errno);
    }
    ~OpenFile() { ::close(descriptor); }

    OpenFile(const OpenFile&) = delete;
    OpenFile& operator=(const OpenFile&) = delete;

    bool isDirectory() const {
        struct stat status {};
        return ::fstat(descriptor, &status) == 0 && S_ISDIR(status.st_mode);
    }

    ssize_t read(char* block, std::size_t size) const { return ::read(descriptor, block, size); }

private:
    // The system would take the path to end at its first NUL.
    static int openedAt(const std::string& path) {
        errno = EINVAL;
        if (path.find('\0') != std::string::npos) return -1;
        return ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY);
    }

    const int descriptor;
};

}  // namespace

std::string readPropertyFile(const std::string& path, const SourceLimits& limits) {
    const OpenFile file(path);
    if (file.isDirectory()) fail(configuration::store_errors::fileNotOpened, path, EISDIR);
    std::string text;
    constexpr std::size_t blockSize = std::size_t{1} << 16U;
    std::array<char, blockSize> block;
    for (;;) {
        const ssize_t count = file.read(block.data(), block.size());
        if (count < 0) fail(fileNotRead, path, errno);
        if (count == 0) return text;
        text.append(block.data(), static_cast<std::size_t>(count));
        if (text.size() > limits.fileBytes) {
            throw std::runtime_error("Property file is larger than " +
                                     std::to_string(limits.fileBytes) + " bytes: " + path);
        }
    }
}

std::shared_ptr<configuration::PropertyFileSource> loadPropertyFile(const std::string& path,
                                                                    const SourceLimits& limits) {
    const std::string text = readPropertyFile(path, limits);
    return std::make_shared<configuration::PropertyFileSource>(configuration::PropertyText{text});
}

}  // namespace velkor::host
