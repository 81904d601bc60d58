#include "host/LoginName.hpp"

#include <pwd.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <vector>

namespace velkor::host {

namespace {

// The name that the system's users have; empty when it knows none.
std::string nameOfUser(uid_t user) {
    constexpr std::size_t usualSize = 1024;
    std::vector<char> texts(usualSize);
    passwd entry{};
    passwd* found = nullptr;
    while (getpwuid_r(user, &entry, texts.data(), texts.size(), &found) == ERANGE) {
        texts.resize(2 * texts.size());
    }
    return found == nullptr ? "" : found->pw_name;
}

}  // namespace

std::string loginName() {
    const uid_t user = geteuid();
    std::string name = nameOfUser(user);
    if (!name.empty()) return name;
    const char* const given = std::getenv("LOGNAME");
    return given != nullptr && *given != '\0' ? given : std::to_string(user);
}

}  // namespace velkor::host
