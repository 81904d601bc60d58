#pragma once

#include <boost/container/small_vector.hpp>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "configuration/Changes.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::settings::detail {

class SettingState;

/// The settings of one store by their keys. Holds them weakly. Thread-safe; calls nobody under its
/// mutex.
class StateIndex {
public:
    using States = boost::container::small_vector<std::shared_ptr<SettingState>, 4>;

    /// Passes the changes of its keys on to `state` from now on.
    void add(const std::shared_ptr<SettingState>& state) VELKOR_EXCLUDES(mutex);
    void remove(const SettingState& state) VELKOR_EXCLUDES(mutex);

    /// All settings that are alive.
    std::vector<std::shared_ptr<SettingState>> all() const VELKOR_EXCLUDES(mutex);

    /// The settings of `key` that are alive.
    States statesOf(const std::string& key) const VELKOR_EXCLUDES(mutex);

    /// Passes `change` on to the settings of its key. Throws, once all have got it, when one
    /// neither takes it nor has the memory to say so.
    void pass(const configuration::OptionChange& change) const VELKOR_EXCLUDES(mutex);

private:
    struct Entry {
        const SettingState* identity;
        std::weak_ptr<SettingState> state;
    };

    mutable common::Mutex mutex;
    std::unordered_map<std::string, std::vector<Entry>> byKey VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::settings::detail
