#include "host/console/Watches.hpp"

#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"

namespace velkor::host {

using configuration::ConfigurationValue;

Watches::Watches(std::shared_ptr<configuration::Configuration> watchedStore, Show showValue)
    : store(std::move(watchedStore)), show(std::move(showValue)) {}

bool Watches::add(const std::string& key) {
    {
        const common::MutexLock lock(mutex);
        if (!handles.try_emplace(key).second) return false;
    }
    reactive_streams::SubscriptionHandle handle;
    try {
        handle = open(key);
    } catch (...) {
        remove(key);
        throw;
    }
    // The values that `open` has shown may have been the reason to remove the watch again.
    const common::MutexLock lock(mutex);
    const auto reserved = handles.find(key);
    if (reserved != handles.end()) reserved->second = std::move(handle);
    return true;
}

bool Watches::remove(const std::string& key) {
    reactive_streams::SubscriptionHandle removed;
    const common::MutexLock lock(mutex);
    const auto found = handles.find(key);
    if (found == handles.end()) return false;
    removed = std::move(found->second);
    handles.erase(found);
    return true;
}

reactive_streams::SubscriptionHandle Watches::open(const std::string& key) const {
    reactive_streams::Callbacks<ConfigurationValue> callbacks;
    callbacks.onValue = [show = show, key](const ConfigurationValue& value) { show(key, value); };
    return reactive_streams::subscribe(*store->watchOption(key), std::move(callbacks));
}

}  // namespace velkor::host
