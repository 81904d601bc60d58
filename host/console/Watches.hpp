#pragma once

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "configuration/Configuration.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"

namespace velkor::host {

/// The keys whose values are shown as they change. All watches end with this object.
///
/// Thread-safe. Values are shown on the thread that changes them, in the order of the changes made
/// there, without the mutex.
class Watches {
public:
    /// Shows one value. Must not wait for a thread that uses the store.
    using Show =
        std::function<void(const std::string& key, const configuration::ConfigurationValue& value)>;

    Watches(std::shared_ptr<configuration::Configuration> store, Show show);

    /// Shows the value of `key`, if there is one, and every later one. Gives false, and does
    /// nothing, when the key is watched already. What showing the value throws passes on, and this
    /// watch is over then; so it is when the key was removed meanwhile.
    bool add(const std::string& key) VELKOR_EXCLUDES(mutex);

    /// As above, but the values are shown by `shownBy`.
    bool add(const std::string& key, const Show& shownBy) VELKOR_EXCLUDES(mutex);

    /// Shows no further values of `key`. Gives false when the key was not watched.
    bool remove(const std::string& key) VELKOR_EXCLUDES(mutex);

    /// The keys that are watched, sorted.
    std::vector<std::string> keys() const VELKOR_EXCLUDES(mutex);

private:
    /// What keeps one watch open, once it is; its address tells it from a later one of the key.
    using Watch = std::shared_ptr<reactive_streams::SubscriptionHandle>;

    reactive_streams::SubscriptionHandle open(const std::string& key, const Show& shownBy) const;
    void forget(const std::string& key, const Watch& watch) VELKOR_EXCLUDES(mutex);

    const std::shared_ptr<configuration::Configuration> store;
    const Show show;
    mutable common::Mutex mutex;
    // Cancelling a handle may wait for the thread that writes to the store, and that may show a
    // value meanwhile: handles end with the mutex released.
    std::map<std::string, Watch> watches VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::host
