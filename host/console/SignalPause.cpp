#include "host/console/SignalPause.hpp"

namespace velkor::host {

SignalPause::SignalPause(std::initializer_list<int> signals) noexcept {
    sigset_t paused;
    sigemptyset(&paused);
    for (const int signal : signals) sigaddset(&paused, signal);
    pthread_sigmask(SIG_BLOCK, &paused, &previous);
}

SignalPause::~SignalPause() {
    pthread_sigmask(SIG_SETMASK, &previous, nullptr);
}

}  // namespace velkor::host
