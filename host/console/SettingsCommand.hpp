#pragma once

#include <memory>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/administration/CommandProvider.hpp"
#include "host/console/CommandRegistration.hpp"

namespace velkor::host {

/// Keeps the command of typed settings registered while it lives. For hosts that declare some:
///
/// - settings [KEY-PREFIX]: a table of the settings of the store, by key; behind it the errors of
///   those whose newest value is not taken. "-" stands for what is empty or not there; a default
///   has no source.
/// - settings --undeclared [KEY-PREFIX]: a table of the keys of the store that nobody has declared,
///   and which declared key each may have been meant to be.
///
/// With a KEY-PREFIX only of keys that it begins. Values of secret keys are shown as •••, long ones
/// are cut after 60 bytes. The handler shares the store, so it may run after this object is gone.
class SettingsCommand final : public administration::CommandProvider {
public:
    /// For the settings of `store`. Neither is null. A name that is taken stays with its owner.
    SettingsCommand(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                    const std::shared_ptr<CommandRegistry>& registry);
    SettingsCommand(const SettingsCommand&) = delete;
    SettingsCommand& operator=(const SettingsCommand&) = delete;

private:
    CommandRegistration registration;
};

}  // namespace velkor::host
