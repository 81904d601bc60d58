#include "benchmarks/fleet/Interruption.hpp"

#include <poll.h>
#include <signal.h>

#include <algorithm>
#include <chrono>
#include <csignal>

namespace velkor::benchmarks {

namespace {

volatile std::sig_atomic_t hasCome = 0;

void handle(void (*handler)(int)) {
    struct sigaction action {};
    action.sa_handler = handler;
    for (const int each : {SIGINT, SIGTERM, SIGHUP}) ::sigaction(each, &action, nullptr);
}

}  // namespace

void Interruption::note() {
    handle([](int) { hasCome = 1; });
}

void Interruption::ignore() {
    handle(SIG_IGN);
}

void Interruption::check() {
    if (hasCome != 0) throw Interrupted();
}

// In parts: a signal may come between the look and the wait.
void Interruption::sleepUntil(FleetClock::time_point end) {
    constexpr std::chrono::milliseconds part{100};
    for (;;) {
        check();
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(end - FleetClock::now());
        if (left.count() <= 0) return;
        ::poll(nullptr, 0, static_cast<int>(std::min(left, part).count()));
    }
}

}  // namespace velkor::benchmarks
