#pragma once

#include <memory>

#include "configuration/Configuration.hpp"
#include "framework/administration/Administration.hpp"
#include "framework/administration/CommandProvider.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// Keeps the operator commands of a store registered while it lives.
///
/// - "velkor.configuration.set" KEY TEXT: stores what `typedText` makes of the text; the text
/// itself
///   where a number is refused. Answers nothing; a refused write is not reported.
/// - "velkor.configuration.get" KEY: the value, or "No configuration option with key: " and KEY.
/// - "velkor.configuration.list": a line "KEY = VALUE" for each key, in byte order.
///
/// Numbers are read and written in the C locale. Keys and values appear as they are: a host that
/// shows them on a terminal escapes control characters there. Handlers may run concurrently and
/// after this object is gone; each keeps the store alive. Called with too few arguments they throw
/// `std::out_of_range`; what the store throws passes through.
class VELKOR_EXPORT ConfigurationCommandProvider : public administration::CommandProvider {
public:
    /// Registers set, get and list, in this order, without waiting for the registry's answers. When
    /// memory runs out or the registry throws, each command that was offered to it is withdrawn,
    /// the one that it threw at too, and the exception passes on.
    ConfigurationCommandProvider(std::shared_ptr<Configuration> configuration,
                                 std::shared_ptr<administration::Administration> administration);
    ConfigurationCommandProvider(const ConfigurationCommandProvider&) = delete;
    ConfigurationCommandProvider& operator=(const ConfigurationCommandProvider&) = delete;

    /// Withdraws the commands in the same order. An exception of the registry ends the process.
    ~ConfigurationCommandProvider() override;

private:
    std::shared_ptr<Configuration> configuration;
    std::shared_ptr<administration::Administration> administration;
};

}  // namespace velkor::configuration
