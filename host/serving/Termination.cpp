#include "host/serving/Termination.hpp"

#include <fcntl.h>
#include <sys/time.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
#include <thread>

namespace velkor::host {

namespace {

constexpr suseconds_t mostMicroseconds = 900'000;

// Read by the handler of the signals, which is installed later.
int nothing = -1;

void giveUp(int) {
    ::_exit(0);
}

// From a signal handler as well.
void beginRelease() {
    itimerval limit{};
    limit.it_value.tv_usec = mostMicroseconds;
    ::setitimer(ITIMER_REAL, &limit, nullptr);
}

void endInput(int) {
    const int kept = errno;
    ::dup2(nothing, STDIN_FILENO);
    beginRelease();
    errno = kept;
}

void handle(int signal, void (*handler)(int)) {
    struct sigaction action {};
    action.sa_handler = handler;  // without SA_RESTART: a read that waits looks again
    sigemptyset(&action.sa_mask);
    ::sigaction(signal, &action, nullptr);
}

bool isIgnored(int signal) {
    struct sigaction action {};
    return ::sigaction(signal, nullptr, &action) == 0 && action.sa_handler == SIG_IGN;
}

// While a line is edited on a terminal, Ctrl-C is a key, and SIGINT is held back from the thread
// that edits: it comes from elsewhere then, and from here as SIGTERM.
void passOnInterrupts() {
    sigset_t all;
    sigset_t before;
    sigfillset(&all);
    ::pthread_sigmask(SIG_SETMASK, &all, &before);
    std::thread([] {
        sigset_t interrupt;
        sigemptyset(&interrupt);
        sigaddset(&interrupt, SIGINT);
        int signal = 0;
        while (::sigwait(&interrupt, &signal) == 0) ::kill(::getpid(), SIGTERM);
    }).detach();
    ::pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

}  // namespace

Termination::Termination(bool withConsole) {
    sigemptyset(&awaited);
    sigaddset(&awaited, SIGINT);
    sigaddset(&awaited, SIGTERM);
    if (!isIgnored(SIGHUP)) sigaddset(&awaited, SIGHUP);
    handle(SIGALRM, giveUp);
    if (!withConsole) {
        ::pthread_sigmask(SIG_BLOCK, &awaited, nullptr);
        return;
    }
    nothing = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    if (nothing < 0) throw std::system_error(errno, std::generic_category(), "/dev/null");
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
        if (sigismember(&awaited, signal) == 1) handle(signal, endInput);
    }
    passOnInterrupts();
}

void Termination::await() const noexcept {
    int signal = 0;
    while (::sigwait(&awaited, &signal) != 0) continue;
    beginRelease();
}

}  // namespace velkor::host
