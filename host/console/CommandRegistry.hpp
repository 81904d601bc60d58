#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "framework/administration/Administration.hpp"
#include "framework/common/Mutex.hpp"
#include "host/console/Command.hpp"

namespace velkor::host {

/// The commands of the console, in the order of their registration.
///
/// Thread-safe. No handler runs under the mutex, and none is destroyed under it: a handler may
/// register and withdraw commands, its own too, and ends in peace after it was withdrawn. All
/// futures are resolved when they are returned. A call that throws, for want of memory, has changed
/// nothing.
class CommandRegistry final : public administration::Administration {
public:
    using CommandPtr = std::shared_ptr<const Command>;

    /// Gives false, and changes nothing, when the name is empty or taken, the handler is empty or
    /// the limits contradict each other.
    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        return registerCommand(std::move(command), CommandTraits());
    }

    /// As above, with what the console is to know besides.
    Future<bool> registerCommand(administration::CommandDescriptor command, CommandTraits traits)
        VELKOR_EXCLUDES(mutex);

    Future<bool> unregisterCommand(const std::string& name) override;

    /// Adds `command`, which is well-formed. Gives false, and changes nothing, when its name is
    /// taken.
    bool add(CommandPtr command) VELKOR_EXCLUDES(mutex);

    /// Withdraws `command` itself, if it is there still; another one of its name stays.
    void remove(const CommandPtr& command) noexcept VELKOR_EXCLUDES(mutex);

    /// The command called `name` or, when there is none, the one whose name ends in "." and `name`.
    /// Throws `CommandError` "Unknown command: " with the name and similar names, or "Ambiguous
    /// command: " with the name and the full names that it may mean.
    CommandPtr find(const std::string& name) const;

    /// All commands that are registered now.
    std::vector<CommandPtr> commands() const;

    /// All names that commands can be called by: the short ones, then the longer full ones.
    std::vector<std::string> names() const;

private:
    mutable common::Mutex mutex;
    std::vector<CommandPtr> registered VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::host
