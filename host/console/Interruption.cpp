#include "host/console/Interruption.hpp"

#include <atomic>
#include <ctime>

namespace velkor::host {

namespace {

std::atomic<bool> requested{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

thread_local bool commandsRunHere = false;

void request(int) {
    requested = true;
}

}  // namespace

Interruption::Interruption() noexcept {
    requested = false;
    commandsRunHere = true;
    struct sigaction action {};
    action.sa_handler = request;  // without SA_RESTART: a system call that waits gives up
    sigemptyset(&action.sa_mask);
    sigaction(SIGINT, &action, &previous);
}

Interruption::~Interruption() {
    sigaction(SIGINT, &previous, nullptr);
    requested = false;
    commandsRunHere = false;
}

bool Interruption::isRequested() noexcept {
    return requested;
}

bool Interruption::isRequestedHere() noexcept {
    return commandsRunHere && requested;
}

bool Interruption::take() noexcept {
    return requested.exchange(false);
}

void Interruption::forget() noexcept {
    sigset_t pausable;
    sigemptyset(&pausable);
    sigaddset(&pausable, SIGINT);
    const timespec noWait{};
    while (sigtimedwait(&pausable, nullptr, &noWait) == SIGINT) continue;
    requested = false;
}

}  // namespace velkor::host
