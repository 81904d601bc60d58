#pragma once

#include <csignal>

namespace velkor::host {

/// How a program that serves is ended: from now on SIGTERM, SIGINT and SIGHUP, unless the last one
/// is ignored, do not end the process at once but let it release everything. They are for the
/// thread that makes it, since no other of the program takes signals. It is for the rest of the
/// process: a second one, which may come meanwhile, changes nothing. Made once.
///
/// What takes longer than a second to be released, such as a large file that is being read for a
/// client, is given up: the process ends then, with status 0.
class Termination {
public:
    /// With a console, the signals put the end of all input in the place of standard input, and
    /// interrupt what waits for it; SIGINT does so unless a command of the console takes it, as
    /// Ctrl-C. Throws `std::system_error`. A thread that waits for SIGINT stays with the process.
    explicit Termination(bool withConsole);
    Termination(const Termination&) = delete;
    Termination& operator=(const Termination&) = delete;

    /// Waits for one of the signals; without a console.
    void await() const noexcept;

private:
    sigset_t awaited{};
};

}  // namespace velkor::host
