#pragma once

#include <csignal>

namespace velkor::host {

/// How a program that serves is ended: from now on SIGTERM does not end the process at once, and
/// without a console neither does SIGINT. They are for the thread that makes it, since no other of
/// the program takes signals. It is for the rest of the process: a second one, which may come while
/// everything is released, changes nothing. Made once.
class Termination {
public:
    /// With a console, SIGTERM puts the end of all input in the place of standard input, and
    /// interrupts what waits for it; SIGINT is the console's. Throws `std::system_error`.
    explicit Termination(bool withConsole);
    Termination(const Termination&) = delete;
    Termination& operator=(const Termination&) = delete;

    /// Waits for one of the signals; without a console.
    void await() const noexcept;

private:
    sigset_t awaited{};
};

}  // namespace velkor::host
