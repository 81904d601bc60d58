#pragma once

#include <memory>

#include "host/console/CommandRegistry.hpp"

namespace velkor::host {

/// Keeps one command registered while it lives. Movable; used by one thread at a time.
class CommandRegistration {
public:
    /// Registers `command`, which is well-formed; a name that is taken stays with its owner.
    CommandRegistration(std::shared_ptr<CommandRegistry> commandRegistry,
                        CommandRegistry::CommandPtr newCommand);
    CommandRegistration(CommandRegistration&& other) noexcept = default;
    CommandRegistration& operator=(CommandRegistration&&) = delete;

    /// Withdraws the command, and never another one that has its name.
    ~CommandRegistration();

private:
    std::shared_ptr<CommandRegistry> registry;  ///< Empty once it was moved from.
    CommandRegistry::CommandPtr command;
};

}  // namespace velkor::host
