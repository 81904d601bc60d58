#include "http/detail/PropertyRoot.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstddef>
#include <filesystem>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include "configuration/StoreErrors.hpp"
#include "http/Refused.hpp"
#include "http/detail/Descriptor.hpp"

namespace velkor::http::detail {

namespace {

namespace store_errors = configuration::store_errors;

std::string systemText(int reason) {
    return std::system_category().message(reason);
}

[[noreturn]] void failToOpen(const std::string& path, const std::string& reason) {
    throw std::runtime_error(store_errors::fileNotOpened + path + ": " + reason);
}

[[noreturn]] void refuse(const std::string& path) {
    throw std::runtime_error(store_errors::fileNotAllowed + path);
}

std::string linkTo(int descriptor) {
    return "/proc/self/fd/" + std::to_string(descriptor);
}

/// Where the file that is open is now.
std::string placeOf(int descriptor) {
    return std::filesystem::read_symlink(linkTo(descriptor)).native();
}

bool isBelow(std::string_view folder, std::string_view path) {
    if (folder != "/" && path.substr(0, folder.size()) != folder) return false;
    const std::string_view rest = path.substr(folder == "/" ? 0 : folder.size());
    return rest.size() > 1 && rest.front() == '/';
}

// Without a look at the file system, which would tell what there is outside.
std::string asWritten(const std::filesystem::path& folder, const std::string& path) {
    return (folder / path).lexically_normal().native();
}

std::string readAll(const Descriptor& file, const std::string& path, std::uintmax_t mostBytes) {
    std::string text;
    constexpr std::size_t blockSize = std::size_t{1} << 16U;
    std::array<char, blockSize> block;
    for (;;) {
        const ssize_t count = ::read(file.get(), block.data(), block.size());
        if (count < 0) failToOpen(path, systemText(errno));
        if (count == 0) return text;
        text.append(block.data(), static_cast<std::size_t>(count));
        if (text.size() > mostBytes) {
            failToOpen(path, "Larger than " + std::to_string(mostBytes) + " bytes");
        }
    }
}

}  // namespace

PropertyRoot::PropertyRoot(const std::string& path, std::uintmax_t mostFileBytes)
    : root(::open(path.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC)),
      name(std::filesystem::absolute(path).lexically_normal().native()),
      mostBytes(mostFileBytes) {
    if (!root) {
        throw Refused("can't use the property root " + path + ": " + systemText(errno));
    }
}

std::string PropertyRoot::read(const std::string& path) const {
    // The system would take the path to end at its first NUL.
    if (path.find('\0') != std::string::npos) failToOpen(path, systemText(EINVAL));
    const std::string folder = placeOf(root.get());
    if (!isBelow(folder, asWritten(folder, path)) && !isBelow(name, asWritten(name, path))) {
        refuse(path);
    }
    // Opens the place and not the file: a pipe isn't waited for, and a device isn't touched.
    const Descriptor place(::openat(root.get(), path.c_str(), O_PATH | O_CLOEXEC));
    if (!place) failToOpen(path, systemText(errno));
    if (!isBelow(folder, placeOf(place.get()))) refuse(path);
    struct stat status {};
    if (::fstat(place.get(), &status) != 0) failToOpen(path, systemText(errno));
    if (!S_ISREG(status.st_mode)) failToOpen(path, "Not a regular file");
    const Descriptor file(::open(linkTo(place.get()).c_str(), O_RDONLY | O_CLOEXEC));
    if (!file) failToOpen(path, systemText(errno));
    return readAll(file, path, mostBytes);
}

}  // namespace velkor::http::detail
