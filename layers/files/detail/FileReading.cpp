#include "layers/files/detail/FileReading.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstddef>
#include <system_error>

#include "configuration/StoreErrors.hpp"

namespace velkor::layers::detail {

namespace {

constexpr const char* fileNotRead = "Property file could not be read: ";

std::string problemWith(const char* text, const std::filesystem::path& path,
                        const std::string& reason) {
    return text + path.string() + ": " + reason;
}

std::string reasonOf(int error) {
    return std::system_category().message(error);
}

class Descriptor {
public:
    explicit Descriptor(int opened) : number(opened) {}
    ~Descriptor() {
        if (number >= 0) ::close(number);
    }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    const int number;
};

// Why `path` is not to be opened; empty if it is. Opening a pipe would be noticed by its other end.
std::string objectionTo(const std::filesystem::path& path) {
    struct stat status {};
    // The system would take the path to end at its first NUL.
    if (path.native().find('\0') != std::string::npos) return reasonOf(EINVAL);
    if (::stat(path.c_str(), &status) != 0) return reasonOf(errno);
    if (S_ISDIR(status.st_mode)) return reasonOf(EISDIR);
    if (!S_ISREG(status.st_mode)) return "Not a regular file";
    return {};
}

FileReading notOpened(const std::filesystem::path& path, const std::string& reason) {
    FileReading reading;
    reading.identity = identityOf(path);
    reading.problem = problemWith(configuration::store_errors::fileNotOpened, path, reason);
    return reading;
}

// Reads to the end, or one block further than is allowed. Gives the error of the system, or 0.
int readInto(std::string& text, int file, std::uintmax_t mostBytes) {
    constexpr std::size_t blockSize = std::size_t{1} << 16U;
    std::array<char, blockSize> block;
    while (text.size() <= mostBytes) {
        const ssize_t count = ::read(file, block.data(), block.size());
        if (count == 0) return 0;
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return errno;
        text.append(block.data(), static_cast<std::size_t>(count));
    }
    return 0;
}

}  // namespace

FileReading readFile(const std::filesystem::path& path, std::uintmax_t mostBytes) {
    const std::string objection = objectionTo(path);
    if (!objection.empty()) return notOpened(path, objection);
    // Another file may stand there by now, which must not be waited for either.
    const Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK));
    if (file.number < 0) return notOpened(path, reasonOf(errno));
    FileReading reading;
    reading.wasOpened = true;
    struct stat status {};
    if (::fstat(file.number, &status) != 0) return notOpened(path, reasonOf(errno));
    const FileIdentity before(status);
    reading.identity = before;
    const bool isTooLarge = static_cast<std::uintmax_t>(status.st_size) > mostBytes;
    const int error = isTooLarge ? 0 : readInto(reading.text, file.number, mostBytes);
    if (error != 0) {
        reading.problem = problemWith(fileNotRead, path, reasonOf(error));
        return reading;
    }
    if (isTooLarge || reading.text.size() > mostBytes) {
        reading.problem = "Property file is larger than " + std::to_string(mostBytes) +
                          " bytes: " + path.string();
        return reading;
    }
    reading.torn = ::fstat(file.number, &status) != 0 || FileIdentity(status) != before ||
                   identityOf(path) != before;
    return reading;
}

}  // namespace velkor::layers::detail
