#pragma once

#include <cstdlib>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/host/StreamFile.hpp"

namespace velkor::host {

/// How long a child may take, in seconds. One that hangs is ended by the system, and its test
/// fails.
inline constexpr unsigned childLifetime = 60;

/// What a program left behind.
struct ChildResult {
    int exitCode;  ///< -1 when a signal ended it.
    std::string out;
    std::string err;
};

/// Replaces this process, a child that was just forked, by the program under test.
[[noreturn]] inline void becomeProgram(const std::vector<std::string>& arguments) {
    std::vector<char*> argv{const_cast<char*>(VELKOR_CONFIG_PROGRAM)};
    for (const auto& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
    argv.push_back(nullptr);
    ::alarm(childLifetime);
    ::signal(SIGINT, SIG_DFL);  // a runner in the background may have it ignored
    ::execv(VELKOR_CONFIG_PROGRAM, argv.data());
    ::_exit(127);
}

/// Waits for a child: its exit code, or -1 when a signal ended it.
inline int waitForExit(pid_t child) {
    int status = 0;
    if (::waitpid(child, &status, 0) != child) throw std::runtime_error("no such child");
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

/// Runs the program under test with `standardInput` as its input. A given descriptor, -1 for none
/// at all, takes the place of its standard output.
inline ChildResult runProgramWithOutput(const std::vector<std::string>& arguments,
                                        std::string_view standardInput, int standardOutput) {
    const StreamFile input(standardInput);
    const StreamFile errors;
    const pid_t child = ::fork();
    if (child < 0) throw std::runtime_error("no child");
    if (child == 0) {
        ::dup2(input.descriptor(), STDIN_FILENO);
        ::dup2(errors.descriptor(), STDERR_FILENO);
        if (standardOutput < 0) {
            ::close(STDOUT_FILENO);
        } else {
            ::dup2(standardOutput, STDOUT_FILENO);
        }
        becomeProgram(arguments);
    }
    const int exitCode = waitForExit(child);
    return {exitCode, "", errors.content()};
}

/// Runs the program under test with `standardInput` as its input.
inline ChildResult runProgram(const std::vector<std::string>& arguments,
                              std::string_view standardInput = "") {
    const StreamFile output;
    ChildResult result = runProgramWithOutput(arguments, standardInput, output.descriptor());
    result.out = output.content();
    return result;
}

}  // namespace velkor::host
