#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"
#include "settings/detail/StateIndex.hpp"

namespace velkor::settings::detail {

/// What keeps all settings of one store up to date: the watch of its changes, and the settings that
/// they are passed on to. Owned by the settings, so that the store is watched as long as there are
/// any. Thread-safe; calls nobody under its mutex.
class Hub : public std::enable_shared_from_this<Hub> {
public:
    /// The hub of `store`, made when there is none.
    static std::shared_ptr<Hub> of(const std::shared_ptr<configuration::ConfigurationImpl>& store);

    /// The hub of `store`; null when there is none.
    static std::shared_ptr<Hub> find(
        const std::shared_ptr<configuration::ConfigurationImpl>& store);

    /// For `of`.
    explicit Hub(const std::shared_ptr<configuration::ConfigurationImpl>& followed);

    /// Ends the watch, for which it waits for the store.
    ~Hub();

    Hub(const Hub&) = delete;
    Hub& operator=(const Hub&) = delete;

    /// Passes the changes of its keys on to `state` from now on.
    void add(const std::shared_ptr<SettingState>& state) { index->add(state); }
    void remove(const SettingState& state) { index->remove(state); }

    /// All settings that are alive.
    std::vector<std::shared_ptr<SettingState>> states() const { return index->all(); }

    /// The settings of `key` that are alive.
    StateIndex::States statesOf(const std::string& key) const { return index->statesOf(key); }

private:
    void watch(std::uint64_t attempt) VELKOR_EXCLUDES(mutex);

    const std::weak_ptr<configuration::ConfigurationImpl> store;
    // Shared with the watch, which passes changes on without a look at the hub.
    const std::shared_ptr<StateIndex> index = std::make_shared<StateIndex>();
    common::Mutex mutex;
    // The newest watch and its number: one may have failed before its handle is kept here.
    reactive_streams::SubscriptionHandle handle VELKOR_GUARDED_BY(mutex);
    std::uint64_t newest VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::settings::detail
