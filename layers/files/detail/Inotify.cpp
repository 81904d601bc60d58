#include "layers/files/detail/Inotify.hpp"

#include <sys/inotify.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstddef>
#include <cstring>

namespace velkor::layers::detail {

Inotify::~Inotify() {
    if (instance >= 0) ::close(instance);
}

int Inotify::watch(const std::string& path, std::uint32_t mask) {
    if (instance < 0) instance = ::inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
    if (instance < 0) return -errno;
    const int number = ::inotify_add_watch(instance, path.c_str(), mask | IN_MASK_ADD);
    if (number < 0) return -errno;
    try {
        ++uses[number];
    } catch (...) {
        ::inotify_rm_watch(instance, number);  // it is new: nobody else uses it
        throw;
    }
    return number;
}

void Inotify::forget(int watch) noexcept {
    const auto found = uses.find(watch);
    if (found == uses.end() || --found->second > 0) return;
    uses.erase(found);
    ::inotify_rm_watch(instance, watch);
}

void Inotify::read(const std::function<void(const Event&)>& tell) {
    constexpr std::size_t blockSize = std::size_t{1} << 16U;
    alignas(inotify_event) std::array<char, blockSize> block;
    const ssize_t size = ::read(instance, block.data(), block.size());
    const char* position = block.data();
    const char* const end = position + std::max<ssize_t>(size, 0);
    while (position < end) {
        inotify_event event{};
        std::memcpy(&event, position, sizeof event);
        position += sizeof event;
        // The name is filled up with NULs.
        const std::string_view name(position, ::strnlen(position, event.len));
        position += event.len;
        if ((event.mask & IN_IGNORED) != 0) uses.erase(event.wd);
        tell({event.wd, event.mask, name});
    }
}

}  // namespace velkor::layers::detail
