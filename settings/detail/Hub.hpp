#pragma once

#include <boost/container/small_vector.hpp>
#include <cstdint>
#include <exception>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"

namespace velkor::settings::detail {

class SettingState;

/// All settings of one store: passes each change on to those of its key. Owned by the settings, so
/// that the store is watched as long as there are any. Thread-safe; calls nobody under its mutex.
class Hub : public std::enable_shared_from_this<Hub> {
public:
    using States = boost::container::small_vector<std::shared_ptr<SettingState>, 4>;

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
    void add(const std::shared_ptr<SettingState>& state) VELKOR_EXCLUDES(mutex);
    void remove(const SettingState& state) VELKOR_EXCLUDES(mutex);

    /// All settings that are alive.
    std::vector<std::shared_ptr<SettingState>> states() const VELKOR_EXCLUDES(mutex);

private:
    struct Entry {
        const SettingState* identity;
        std::weak_ptr<SettingState> state;
    };

    void watch(std::uint64_t attempt) VELKOR_EXCLUDES(mutex);
    void pass(const configuration::OptionChange& change) const VELKOR_EXCLUDES(mutex);
    States statesOf(const std::string& key) const VELKOR_EXCLUDES(mutex);

    const std::weak_ptr<configuration::ConfigurationImpl> store;
    mutable common::Mutex mutex;
    std::unordered_map<std::string, std::vector<Entry>> byKey VELKOR_GUARDED_BY(mutex);
    // The newest watch and its number: one may have failed before its handle is kept here.
    reactive_streams::SubscriptionHandle handle VELKOR_GUARDED_BY(mutex);
    std::uint64_t newest VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::settings::detail
