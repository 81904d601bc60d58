#pragma once

#include <chrono>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <poll.h>
#include <pty.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/types.h>
#include <termios.h>
#include <unistd.h>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::host {

/// The program under test on a terminal of its own, with a person at the keys.
class TerminalSession {
public:
    /// A terminal without `abilities` shows what is written as it is. Nothing outlasts the session
    /// unless `environment` (NAME=VALUE) says where.
    explicit TerminalSession(const std::vector<std::string>& arguments,
                             const char* abilities = "dumb",
                             const std::vector<std::string>& environment = {}) {
        child = ::forkpty(&keys, nullptr, nullptr, nullptr);
        if (child < 0) throw std::runtime_error("no pseudo terminal");
        if (child == 0) {
            // Nobody's own key bindings have a say.
            ::setenv("TERM", abilities, 1);
            ::setenv("HOME", "/nonexistent", 1);
            ::setenv("LC_ALL", "C", 1);
            ::unsetenv("XDG_STATE_HOME");
            ::unsetenv("NO_COLOR");
            for (const auto& variable : environment) ::putenv(const_cast<char*>(variable.c_str()));
            becomeProgram(arguments);
        }
    }

    ~TerminalSession() {
        if (child > 0) {
            ::kill(child, SIGKILL);
            waitForExit(child);
        }
        ::close(keys);
    }

    TerminalSession(const TerminalSession&) = delete;
    TerminalSession& operator=(const TerminalSession&) = delete;

    /// Presses keys.
    void type(const std::string& text) {
        if (::write(keys, text.data(), text.size()) != static_cast<ssize_t>(text.size())) {
            throw std::runtime_error("the terminal takes no keys");
        }
    }

    /// Whether `text` appears after what earlier calls have waited for.
    [[nodiscard]] bool shows(const std::string& text) { return showsWithin(patience, text); }

    /// Presses `key` until `text` appears; for a key that is lost when it comes too early.
    [[nodiscard]] bool showsAfterPressing(const std::string& key, const std::string& text) {
        constexpr std::chrono::milliseconds interval{20};
        for (auto waited = interval; waited < patience; waited += interval) {
            type(key);
            if (showsWithin(interval, text)) return true;
        }
        return false;
    }

    /// Gives the terminal another size, of which the system tells the program.
    void resize(unsigned rows, unsigned columns) const {
        winsize size{};
        size.ws_row = static_cast<unsigned short>(rows);
        size.ws_col = static_cast<unsigned short>(columns);
        ::ioctl(keys, TIOCSWINSZ, &size);
    }

    /// Sends the program a signal.
    void signal(int number) const { ::kill(child, number); }

    /// Whether the terminal edits lines itself, as terminals ordinarily do.
    bool isOrdinary() const {
        termios settings{};
        return ::tcgetattr(keys, &settings) == 0 && (settings.c_lflag & ICANON) != 0 &&
               (settings.c_lflag & ISIG) != 0;
    }

    /// Whether the terminal is ordinary, or becomes so: no line is edited.
    [[nodiscard]] bool becomesOrdinary() const {
        const auto deadline = std::chrono::steady_clock::now() + patience;
        while (!isOrdinary()) {
            if (std::chrono::steady_clock::now() > deadline) return false;
            std::this_thread::yield();
        }
        return true;
    }

    /// Everything that has appeared.
    const std::string& everything() const { return screen; }

    /// Waits for the end of the program; its exit code.
    int exitCode() {
        while (readMore()) continue;
        const int code = waitForExit(child);
        child = 0;
        return code;
    }

private:
    using Milliseconds = std::chrono::milliseconds;

    static constexpr Milliseconds patience = velkor::testing::patience;

    bool showsWithin(Milliseconds limit, const std::string& text) {
        const auto deadline = std::chrono::steady_clock::now() + limit;
        for (;;) {
            const std::size_t found = screen.find(text, seen);
            if (found != std::string::npos) {
                seen = found + text.size();
                return true;
            }
            if (std::chrono::steady_clock::now() > deadline || !readMore(limit)) return false;
        }
    }

    // False at the end of the program, and when nothing appears for too long.
    bool readMore(Milliseconds limit = patience) {
        pollfd ready{keys, POLLIN, 0};
        if (::poll(&ready, 1, static_cast<int>(limit.count())) != 1) return false;
        char buffer[4096];
        const ssize_t count = ::read(keys, buffer, sizeof buffer);
        if (count <= 0) return false;
        screen.append(buffer, static_cast<std::size_t>(count));
        return true;
    }

    int keys = -1;
    pid_t child = -1;
    std::string screen;
    std::size_t seen = 0;
};

}  // namespace velkor::host
