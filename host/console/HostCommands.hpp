#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/administration/CommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Watches.hpp"

namespace velkor::host {

/// What the host's own commands work on. No member is empty.
struct HostServices {
    std::shared_ptr<configuration::ConfigurationImpl> store;
    std::shared_ptr<Watches> watches;
    std::function<void()> quit;  ///< Ends the session.
};

/// Keeps the host's own commands registered while it lives:
///
/// - sources: a table of all sources in order of precedence.
/// - explain KEY: a table of the sources that hold KEY in order of precedence, the first of which
///   is the effective one.
/// - watch KEY, unwatch KEY: show the values of KEY as they change, and no longer.
/// - help [COMMAND], quit.
///
/// Handlers share the services, so they may run after this object is gone. Called with too few
/// arguments they throw `std::out_of_range`.
class HostCommands final : public administration::CommandProvider {
public:
    /// Registers the commands in this order; a name that is taken stays with its owner.
    HostCommands(HostServices services, std::shared_ptr<CommandRegistry> registry);
    HostCommands(const HostCommands&) = delete;
    HostCommands& operator=(const HostCommands&) = delete;
    ~HostCommands() override;

private:
    std::shared_ptr<CommandRegistry> registry;
    std::vector<std::string> names;  ///< Of the commands that the registry accepted.
};

}  // namespace velkor::host
