#pragma once

#include <string>
#include <vector>

#include "host/Options.hpp"
#include "host/console/CommandRegistry.hpp"

namespace velkor::host {

/// The program's options and commands in one of the forms that are made of them:
///
/// - man: a page of the manual, in the macros of man(7)
/// - bash: completion for bash
/// - usage: a line for each option, with its value, and for each command, with its arguments
///
/// Throws `UsageError` "--manual: one of man, bash, usage is needed".
std::string manual(const std::string& form, const ProgramUsage& usage,
                   const std::vector<CommandRegistry::CommandPtr>& commands);

}  // namespace velkor::host
