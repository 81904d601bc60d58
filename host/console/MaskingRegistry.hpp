#pragma once

#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/administration/Administration.hpp"
#include "host/console/CommandRegistry.hpp"

namespace velkor::host {

/// Registers commands with another registry so that "velkor.configuration.get" and
/// "velkor.configuration.list" show ••• for the secret keys of a store, see `settings::secretKeys`.
/// What they show of other keys, and all other commands, stay as they are; but the list is written
/// as it is made. Thread-safe.
class MaskingRegistry final : public administration::Administration {
public:
    /// For commands that show values of `store`. Neither is null.
    MaskingRegistry(std::shared_ptr<configuration::ConfigurationImpl> store,
                    std::shared_ptr<CommandRegistry> registry);

    Future<bool> registerCommand(administration::CommandDescriptor command) override;
    Future<bool> unregisterCommand(const std::string& name) override;

private:
    const std::shared_ptr<configuration::ConfigurationImpl> store;
    const std::shared_ptr<CommandRegistry> registry;
};

}  // namespace velkor::host
