#include "host/serving/Termination.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

namespace velkor::host {

namespace {

// Read by the handler of the signal, which is installed later.
int nothing = -1;

void endInput(int) {
    const int kept = errno;
    ::dup2(nothing, STDIN_FILENO);
    errno = kept;
}

void endInputBySignal() {
    nothing = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    if (nothing < 0) throw std::system_error(errno, std::generic_category(), "/dev/null");
    struct sigaction action {};
    action.sa_handler = endInput;  // without SA_RESTART: a read that waits looks again
    sigemptyset(&action.sa_mask);
    ::sigaction(SIGTERM, &action, nullptr);
}

}  // namespace

Termination::Termination(bool withConsole) {
    sigemptyset(&awaited);
    if (withConsole) {
        endInputBySignal();
        return;
    }
    sigaddset(&awaited, SIGINT);
    sigaddset(&awaited, SIGTERM);
    ::pthread_sigmask(SIG_BLOCK, &awaited, nullptr);
}

void Termination::await() const noexcept {
    int signal = 0;
    while (::sigwait(&awaited, &signal) != 0) continue;
}

}  // namespace velkor::host
