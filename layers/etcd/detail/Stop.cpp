#include "layers/etcd/detail/Stop.hpp"

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <system_error>

#include "layers/etcd/detail/GatewayErrors.hpp"

namespace velkor::layers::etcd {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds longestPoll = std::chrono::hours(1);

// Rounded up: whoever is woken too early would spin.
int pollTime(Stop::Time end) {
    const auto now = std::chrono::steady_clock::now();
    if (end <= now) return 0;
    const auto left = std::chrono::ceil<milliseconds>(end - now);
    return static_cast<int>(std::clamp(left, milliseconds(0), longestPoll).count());
}

}  // namespace

Stop::Stop() : descriptor(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {
    if (descriptor < 0) throw std::system_error(errno, std::generic_category(), "eventfd");
}

Stop::~Stop() {
    ::close(descriptor);
}

void Stop::request() noexcept {
    const std::uint64_t one = 1;
    static_cast<void>(!::write(descriptor, &one, sizeof one));  // stays readable for ever
}

void Stop::check() const {
    await(-1, 0, Time::min());
}

void Stop::sleepUntil(Time end) const {
    while (await(-1, 0, end)) continue;
}

bool Stop::await(int socket, short events, Time end) const {
    for (;;) {
        std::array<pollfd, 2> polled{{{descriptor, POLLIN, 0}, {socket, events, 0}}};
        const int ready = ::poll(polled.data(), polled.size(), pollTime(end));
        if (ready < 0 && errno != EINTR) {
            throw std::system_error(errno, std::generic_category(), "poll");
        }
        if (ready > 0 && polled[0].revents != 0) throw Stopped();
        if (ready > 0) return true;
        if (std::chrono::steady_clock::now() >= end) return false;
    }
}

}  // namespace velkor::layers::etcd
