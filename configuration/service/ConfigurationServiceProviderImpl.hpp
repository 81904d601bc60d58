#pragma once

#include <memory>

#include "configuration/Configuration.hpp"
#include "configuration/service/ConfigurationServiceProvider.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// Answers configuration requests from a store.
///
/// Thread-safe without a lock of its own: each handler runs on the thread that delivers the request
/// and blocks it until the store's future is resolved; the store serialises concurrent requests.
/// The returned futures are resolved. What the store throws or puts into its futures is thrown from
/// the handler, and so from `deliver`.
class VELKOR_EXPORT ConfigurationServiceProviderImpl : public ConfigurationServiceProvider {
public:
    /// Shares `configuration`, which is not null, with its other users.
    explicit ConfigurationServiceProviderImpl(std::shared_ptr<Configuration> configuration);

    /// Asks the store for the option only when it has the key. A key that disappears in between
    /// throws what `Configuration::getOption` fails with.
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationGet>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override;

    /// Writes into the named source, or into the first that takes the key when no name is given.
    /// Throws what `Configuration::set` fails with, "No writable configuration source for key: "
    /// and the key, for example.
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationSet>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override;

    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationKeys>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override;

    /// Throws what `Configuration::addPropertyFileSource` throws and fails with.
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<AddPropertyFileSource>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override;

private:
    ConfigurationValue write(const ConfigurationSet& request);

    std::shared_ptr<Configuration> configuration;
};

}  // namespace velkor::configuration
