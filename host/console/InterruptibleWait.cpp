#include "host/console/InterruptibleWait.hpp"

#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <cerrno>
#include <memory>
#include <optional>
#include <system_error>
#include <utility>

#include "host/console/Interruption.hpp"

namespace velkor::host {

namespace {

/// Happens once. Thread-safe.
class Event {
public:
    Event() : descriptor(::eventfd(0, EFD_CLOEXEC)) {
        if (descriptor < 0) throw std::system_error(errno, std::generic_category(), "eventfd");
    }
    ~Event() { ::close(descriptor); }

    Event(const Event&) = delete;
    Event& operator=(const Event&) = delete;

    void happen() const noexcept { ::eventfd_write(descriptor, 1); }

    /// Waits a while, less when a signal comes; gives whether it has happened.
    bool hasComeSoon() const noexcept {
        constexpr int milliseconds = 50;  // a signal may come between two waits, or elsewhere
        pollfd awaited{descriptor, POLLIN, 0};
        return ::poll(&awaited, 1, milliseconds) > 0;
    }

private:
    const int descriptor;
};

}  // namespace

bool resultUnlessInterrupted(Future<bool>&& pending) {
    const auto settled = std::make_shared<Event>();
    // Taken over rather than thrown where it is resolved: an error belongs to the caller alone
    // then.
    const auto outcome = std::make_shared<std::optional<Future<bool>>>();
    Future<bool> taken = pending.then([settled, outcome](Future<bool>&& resolved) {
        outcome->emplace(std::move(resolved));
        settled->happen();
        return true;
    });
    while (!settled->hasComeSoon()) {
        if (Interruption::isRequested()) throw Interrupted();
    }
    taken.get();
    return (*outcome)->get();
}

}  // namespace velkor::host
