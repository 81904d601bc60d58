#include "http/detail/ClientStore.hpp"

#include <stdexcept>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/common/TextConversion.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

using configuration::ConfigurationValue;

ClientStore::ClientStore(std::shared_ptr<configuration::ConfigurationImpl> servedStore,
                         std::shared_ptr<const PropertyRoot> propertyRoot)
    : store(std::move(servedStore)), root(std::move(propertyRoot)) {}

Future<ConfigurationValue> ClientStore::get(const std::string& key) {
    return store->get(key);
}

Future<configuration::Option> ClientStore::getOption(const std::string& key) {
    return store->getOption(key);
}

Future<ConfigurationValue> ClientStore::set(const std::string& key, ConfigurationValue value) {
    return store->set(key, std::move(value));
}

Future<ConfigurationValue> ClientStore::set(const std::string& key, ConfigurationValue value,
                                            const std::string& sourceName) {
    return store->set(key, std::move(value), sourceName);
}

Future<bool> ClientStore::has(const std::string& key) {
    return store->has(key);
}

Future<std::set<std::string>> ClientStore::keys() {
    return store->keys();
}

std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> ClientStore::watchOption(
    const std::string& key) {
    return store->watchOption(key);
}

Future<bool> ClientStore::addPropertyFileSource(const std::string& name, const std::string& group,
                                                int order, bool readOnly,
                                                const std::u16string& path) {
    const std::string narrowPath = common::TextConversion("UTF-8").fromUtf16(path);
    if (root == nullptr) {
        throw std::runtime_error(configuration::store_errors::fileNotAllowed + narrowPath);
    }
    const std::string text = root->read(narrowPath);
    return store->addSource(
        name, group, order, readOnly,
        std::make_shared<configuration::PropertyFileSource>(configuration::PropertyText{text}));
}

Future<bool> ClientStore::addInMemorySource(const std::string& name, const std::string& group,
                                            int order, bool readOnly,
                                            configuration::ValueMap&& values) {
    return store->addInMemorySource(name, group, order, readOnly, std::move(values));
}

Future<bool> ClientStore::addEnvironmentSource(const std::string& name, const std::string& group,
                                               int order) {
    return store->addEnvironmentSource(name, group, order);
}

Future<bool> ClientStore::removeSource(const std::string& name) {
    return store->removeSource(name);
}

std::shared_ptr<configuration::Configuration> ClientStore::getPtr() {
    return store;
}

messages::Secrets secretsOf(const std::shared_ptr<configuration::ConfigurationImpl>& store) {
    return {[store](const std::string& key) { return settings::isSecret(store, key); },
            settings::secretMark};
}

}  // namespace velkor::http::detail
