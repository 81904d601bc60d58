#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"

namespace velkor::host {

/// What the program tells its caller at its end.
enum class ExitCode {
    fine = 0,
    commandFailed = 1,  ///< At least one command, or the writing of answers, failed.
    badUsage = 2,
    sourceNotLoaded = 3,  ///< The session went on without it, whatever the commands did.
};

/// Declares the settings of a program in the store of a session, once the sources of the command
/// line are loaded. What it gives owns them until the session ends.
using DeclareSettings = std::function<std::shared_ptr<const void>(
    const std::shared_ptr<configuration::ConfigurationImpl>& store)>;

/// Runs the program on the process's standard streams. `arguments` are those after its name.
///
/// A program that has settings declares them by `declare`, which may be empty: they can be listed
/// by the command of `SettingsCommand` then, and secret values are shown as •••. What `declare`
/// throws ends the program before the first command and leaves this call.
ExitCode runProgram(const std::vector<std::string>& arguments,
                    const DeclareSettings& declare = nullptr);

}  // namespace velkor::host
