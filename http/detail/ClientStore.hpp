#pragma once

#include <memory>
#include <set>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "http/detail/PropertyRoot.hpp"
#include "messages/Secrets.hpp"

namespace velkor::http::detail {

/// A store as the messages of clients reach it: all of it, but for property files, of which they
/// may add only those below a root. Values are as they are, see `secretsOf`.
///
/// Thread-safe, as the store is. No lock of its own.
class ClientStore final : public configuration::Configuration {
public:
    /// Passes everything on to `servedStore`, which is not null. Without a `propertyRoot` no file
    /// is taken.
    ClientStore(std::shared_ptr<configuration::ConfigurationImpl> servedStore,
                std::shared_ptr<const PropertyRoot> propertyRoot);

    Future<configuration::ConfigurationValue> get(const std::string& key) override;
    Future<configuration::Option> getOption(const std::string& key) override;
    using Configuration::set;
    Future<configuration::ConfigurationValue> set(const std::string& key,
                                                  configuration::ConfigurationValue value) override;
    Future<configuration::ConfigurationValue> set(const std::string& key,
                                                  configuration::ConfigurationValue value,
                                                  const std::string& sourceName) override;
    Future<bool> has(const std::string& key) override;
    Future<std::set<std::string>> keys() override;
    std::shared_ptr<reactive_streams::PublisherAPI<configuration::ConfigurationValue>> watchOption(
        const std::string& key) override;

    /// Adds the file that `PropertyRoot::read` reads, and throws what it throws; without a root
    /// "Property file not allowed: " and the path. Otherwise as the store.
    using Configuration::addPropertyFileSource;
    Future<bool> addPropertyFileSource(const std::string& name, const std::string& group, int order,
                                       bool readOnly, const std::u16string& path) override;
    Future<bool> addInMemorySource(const std::string& name, const std::string& group, int order,
                                   bool readOnly, configuration::ValueMap&& values) override;
    Future<bool> addEnvironmentSource(const std::string& name, const std::string& group,
                                      int order) override;
    Future<bool> removeSource(const std::string& name) override;

    /// The store itself.
    std::shared_ptr<Configuration> getPtr() override;

private:
    const std::shared_ptr<configuration::ConfigurationImpl> store;
    const std::shared_ptr<const PropertyRoot> root;
};

/// What the replies to messages about `store` must not show: the values of its secret keys, see
/// `settings::isSecret`. Shares the store.
messages::Secrets secretsOf(const std::shared_ptr<configuration::ConfigurationImpl>& store);

}  // namespace velkor::http::detail
