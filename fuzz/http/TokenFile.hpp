#pragma once

#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <stdexcept>
#include <string>

namespace velkor::fuzz::http {

/// A file that only its owner may read, in memory, for as long as this lives.
class TokenFile {
public:
    explicit TokenFile(const std::string& content) : number(::memfd_create("tokens", MFD_CLOEXEC)) {
        const auto size = static_cast<ssize_t>(content.size());
        if (number < 0 || ::fchmod(number, S_IRUSR | S_IWUSR) != 0 ||
            ::write(number, content.data(), content.size()) != size) {
            throw std::runtime_error("There is no file in memory.");
        }
    }
    ~TokenFile() { ::close(number); }

    TokenFile(const TokenFile&) = delete;
    TokenFile& operator=(const TokenFile&) = delete;

    std::string path() const { return "/proc/self/fd/" + std::to_string(number); }

private:
    const int number;
};

}  // namespace velkor::fuzz::http
