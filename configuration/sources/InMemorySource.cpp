#include "configuration/sources/InMemorySource.hpp"

#include <utility>

#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration {

InMemorySource::InMemorySource(ValueMap&& initialValues) {
    values.swap(initialValues);
}

ConfigurationValue InMemorySource::get(const std::string& key) {
    return values.at(key);
}

ConfigurationValue InMemorySource::set(const std::string& key, ConfigurationValue value) {
    ConfigurationValue answer;
    if (const auto entry = values.find(key); entry != values.end()) {
        answer = std::exchange(entry->second, std::move(value));
    } else {
        answer = value;
        values.emplace(key, std::move(value));
    }
    if (listener) listener(key);
    return answer;
}

bool InMemorySource::has(const std::string& key) {
    return values.find(key) != values.end();
}

void InMemorySource::setChangeListener(ChangeListener newListener) {
    listener.swap(newListener);
}

std::set<std::string> InMemorySource::keys() {
    return sortedKeys(values);
}

}  // namespace velkor::configuration
