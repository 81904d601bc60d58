#include "settings/Secrets.hpp"

#include "settings/detail/Hub.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings {

std::set<std::string> secretKeys(const std::shared_ptr<configuration::ConfigurationImpl>& store) {
    std::set<std::string> keys;
    const auto hub = detail::Hub::find(store);
    if (hub == nullptr) return keys;
    for (const auto& state : hub->states()) {
        for (const detail::Declared& declared : state->keys()) {
            if (declared.secret) keys.insert(declared.key);
        }
    }
    return keys;
}

bool isSecret(const std::shared_ptr<configuration::ConfigurationImpl>& store,
              const std::string& key) {
    const auto hub = detail::Hub::find(store);
    if (hub == nullptr) return false;
    for (const auto& state : hub->statesOf(key)) {
        for (const detail::Declared& declared : state->keys()) {
            if (declared.secret && declared.key == key) return true;
        }
    }
    return false;
}

}  // namespace velkor::settings
