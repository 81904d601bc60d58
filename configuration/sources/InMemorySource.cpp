#include "configuration/sources/InMemorySource.hpp"

#include <utility>

namespace velkor::configuration {

InMemorySource::InMemorySource(ValueMap&& initialValues)
    : TableSource(typeid(InMemorySource), std::move(initialValues), Code::own) {}

ConfigurationValue InMemorySource::set(const std::string& key, ConfigurationValue value) {
    if (ConfigurationValue* present = values.find(key)) {
        ConfigurationValue replaced = std::exchange(*present, std::move(value));
        notify(key);
        return replaced;
    }
    ConfigurationValue answer = value;
    values.insert(key, std::move(value));
    notify(key);
    return answer;
}

std::optional<ConfigurationValue> InMemorySource::unset(const std::string& key) {
    auto removed = values.take(key);
    if (removed) notify(key);
    return removed;
}

}  // namespace velkor::configuration
