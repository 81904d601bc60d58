#include "host/console/Watches.hpp"

#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"

namespace velkor::host {

using configuration::ConfigurationValue;

Watches::Watches(std::shared_ptr<configuration::Configuration> watchedStore, Show showValue)
    : store(std::move(watchedStore)), show(std::move(showValue)) {}

bool Watches::add(const std::string& key) {
    return add(key, show);
}

bool Watches::add(const std::string& key, const Show& shownBy) {
    const auto watch = std::make_shared<reactive_streams::SubscriptionHandle>();
    {
        const common::MutexLock lock(mutex);
        if (!watches.try_emplace(key, watch).second) return false;
    }
    reactive_streams::SubscriptionHandle handle;
    try {
        handle = open(key, shownBy);
    } catch (...) {
        forget(key, watch);
        throw;
    }
    // The key may have been removed since, even by the values that `open` has shown, and added
    // again.
    const common::MutexLock lock(mutex);
    const auto found = watches.find(key);
    if (found != watches.end() && found->second == watch) *watch = std::move(handle);
    return true;
}

bool Watches::remove(const std::string& key) {
    Watch removed;
    const common::MutexLock lock(mutex);
    const auto found = watches.find(key);
    if (found == watches.end()) return false;
    removed = std::move(found->second);
    watches.erase(found);
    return true;
}

std::vector<std::string> Watches::keys() const {
    const common::MutexLock lock(mutex);
    std::vector<std::string> keys;
    for (const auto& watch : watches) keys.push_back(watch.first);
    return keys;
}

void Watches::forget(const std::string& key, const Watch& watch) {
    const common::MutexLock lock(mutex);
    const auto found = watches.find(key);
    if (found != watches.end() && found->second == watch) watches.erase(found);
}

reactive_streams::SubscriptionHandle Watches::open(const std::string& key,
                                                   const Show& shownBy) const {
    reactive_streams::Callbacks<ConfigurationValue> callbacks;
    callbacks.onValue = [shownBy, key](const ConfigurationValue& value) { shownBy(key, value); };
    return reactive_streams::subscribe(*store->watchOption(key), std::move(callbacks));
}

}  // namespace velkor::host
