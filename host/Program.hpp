#pragma once

#include <string>
#include <vector>

namespace velkor::host {

/// What the program tells its caller at its end.
enum class ExitCode {
    fine = 0,
    commandFailed = 1,  ///< At least one command, or the writing of answers, failed.
    badUsage = 2,
    sourceNotLoaded = 3,  ///< The session went on without it, whatever the commands did.
};

/// Runs the program on the process's standard streams. `arguments` are those after its name.
ExitCode runProgram(const std::vector<std::string>& arguments);

}  // namespace velkor::host
