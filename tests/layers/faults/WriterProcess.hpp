#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

namespace velkor::testing {

/// A program that reports numbers over a pipe, its standard output, until it is killed.
class WriterProcess {
public:
    /// Starts the program `arguments[0]`.
    explicit WriterProcess(const std::vector<std::string>& arguments) {
        std::vector<char*> argv;
        for (const auto& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
        argv.push_back(nullptr);
        int ends[2];
        if (::pipe(ends) != 0) throw std::runtime_error("no pipe");
        process = ::fork();
        if (process < 0) throw std::runtime_error("no child");
        if (process == 0) {
            ::dup2(ends[1], STDOUT_FILENO);
            ::close(ends[0]);
            ::close(ends[1]);
            ::alarm(60);  // the system ends one that was forgotten
            ::execv(argv[0], argv.data());
            ::_exit(127);
        }
        ::close(ends[1]);
        reports = ends[0];
    }

    ~WriterProcess() {
        kill();
        ::close(reports);
    }

    WriterProcess(const WriterProcess&) = delete;
    WriterProcess& operator=(const WriterProcess&) = delete;

    /// Waits for the next number; nothing when the program is gone.
    std::optional<std::uint64_t> nextReport() {
        std::uint64_t number = 0;
        // Pipes don't divide what is this short.
        if (::read(reports, &number, sizeof number) != sizeof number) return std::nullopt;
        return number;
    }

    /// Ends the program without a warning, and says whether it was alive by then.
    bool kill() {
        if (process < 0) return false;
        ::kill(process, SIGKILL);
        int status = 0;
        ::waitpid(process, &status, 0);
        process = -1;
        return WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL;
    }

private:
    pid_t process;
    int reports;
};

}  // namespace velkor::testing
