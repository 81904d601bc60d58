#include "configuration/sources/InMemorySource.hpp"

#include <utility>

namespace velkor::configuration {

InMemorySource::InMemorySource(ValueMap&& initialValues) : values(std::move(initialValues)) {}

ConfigurationValue InMemorySource::get(const std::string& key) {
    return values.at(key);
}

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

void InMemorySource::notify(const std::string& key) {
    if (listener) listener(key);
}

bool InMemorySource::has(const std::string& key) {
    return table().find(key) != nullptr;
}

void InMemorySource::setChangeListener(ChangeListener newListener) {
    listener.swap(newListener);
}

std::set<std::string> InMemorySource::keys() {
    return values.keys();
}

}  // namespace velkor::configuration
