#pragma once

#include <csignal>
#include <exception>

namespace velkor::host {

/// What a command throws that ends early since Ctrl-C was pressed.
class Interrupted : public std::exception {
public:
    const char* what() const noexcept override { return "Interrupted."; }
};

/// While it lives, Ctrl-C (SIGINT) ends what is being carried out and not the program: it sets a
/// mark, and interrupts a system call that waits. One at a time; made and destroyed by the thread
/// that carries out commands.
class Interruption {
public:
    Interruption() noexcept;
    ~Interruption();

    Interruption(const Interruption&) = delete;
    Interruption& operator=(const Interruption&) = delete;

    /// Whether Ctrl-C was pressed since the mark was cleared last. False while there is no
    /// `Interruption`.
    static bool isRequested() noexcept;

    /// As above, on the thread that carries out commands; false on all others, whose work Ctrl-C is
    /// not about.
    static bool isRequestedHere() noexcept;

    /// Clears the mark and gives whether it was set.
    static bool take() noexcept;

    /// Clears the mark, and drops what a `SignalPause` on this thread puts off.
    static void forget() noexcept;

private:
    struct sigaction previous {};
};

}  // namespace velkor::host
