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

}  // namespace velkor::settings
