#pragma once

#include <functional>
#include <memory>
#include <string>

#include "framework/administration/Administration.hpp"
#include "host/SessionStore.hpp"
#include "host/console/CommandRegistry.hpp"

namespace velkor::host {

/// Registers the commands of the store as the console offers them, with the names of their
/// arguments: "velkor.configuration.set" with a remark when what it stored is not what was typed,
/// see `isMeantBy`; "velkor.configuration.get" and "velkor.configuration.list" with ••• for secret
/// keys, see `settings::secretKeys`, and the list written as it is made. What else they answer
/// stays as it is. Thread-safe.
///
/// A remark is "set KEY: TEXT was stored as VALUE; put stores the whole word", or "set KEY: nothing
/// was stored; put says why". Values of secret keys are ••• there.
class StoreCommandRegistry final : public administration::Administration {
public:
    using Remark = std::function<void(std::string)>;

    /// For commands on `store`, whose remarks go to `remark` on the threads of the commands. Gives
    /// them to `registry`. None of them is null.
    StoreCommandRegistry(std::shared_ptr<SessionStore> store,
                         std::shared_ptr<CommandRegistry> registry, Remark remark);

    Future<bool> registerCommand(administration::CommandDescriptor command) override;
    Future<bool> unregisterCommand(const std::string& name) override;

private:
    const std::shared_ptr<SessionStore> store;
    const std::shared_ptr<CommandRegistry> registry;
    const Remark remark;
};

}  // namespace velkor::host
