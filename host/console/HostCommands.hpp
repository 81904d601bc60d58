#pragma once

#include <functional>
#include <memory>
#include <vector>

#include "framework/administration/CommandProvider.hpp"
#include "host/SessionStore.hpp"
#include "host/console/CommandRegistration.hpp"
#include "host/console/Watches.hpp"
#include "host/sources/SessionSources.hpp"
#include "messages/MessageDispatcher.hpp"

namespace velkor::host {

/// What the host's own commands work on. No member is empty.
struct HostServices {
    std::shared_ptr<SessionStore> store;
    std::shared_ptr<Watches> watches;
    std::shared_ptr<const messages::MessageDispatcher> dispatcher;
    std::function<void()> quit;  ///< Ends the session.
    std::shared_ptr<SessionSources> sources{};
    /// Shows a value that is watched as JSON.
    Watches::Show showJson = [](const auto&, const auto&) {};
};

/// Keeps the host's own commands registered while it lives:
///
/// - sources [--json]: a table of all sources in order of precedence, with how they stand and what
///   is the matter with them.
/// - explain KEY [--json]: a table of the sources that hold KEY in order of precedence, the first
///   of which is the effective one.
/// - watch KEY [--json], unwatch KEY: show the values of KEY as they change, and no longer.
/// - load, unload: see SourceCommands.hpp.
/// - put: see PutCommand.hpp.
/// - unset, history [KEY] [--limit N], undo [N]: see StateCommands.hpp.
/// - send [--raw] TYPE [JSON]: delivers a message and shows the reply, see `sendMessage`; with
///   --raw nothing but its JSON. JSON is the rest of the line as it was typed.
/// - help [COMMAND], quit; also as ? and exit.
///
/// With --json the answer is JSON, see JsonAnswers.hpp. Values of secret keys, see
/// `settings::secretKeys`, are shown as •••.
///
/// Handlers share the services, so they may run after this object is gone. Called with too few
/// arguments they throw `std::out_of_range`.
class HostCommands final : public administration::CommandProvider {
public:
    /// Registers the commands in this order; a name that is taken stays with its owner. When this
    /// throws, none of them is left registered.
    HostCommands(HostServices services, const std::shared_ptr<CommandRegistry>& registry);
    HostCommands(const HostCommands&) = delete;
    HostCommands& operator=(const HostCommands&) = delete;

private:
    std::vector<CommandRegistration> registrations;
};

}  // namespace velkor::host
