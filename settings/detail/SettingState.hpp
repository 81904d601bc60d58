#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Export.hpp"
#include "framework/common/Mutex.hpp"
#include "settings/detail/Declared.hpp"
#include "settings/detail/Gate.hpp"

namespace velkor::settings::detail {

class Hub;

/// What a setting is behind its type: its keys, how they stand, and how it follows the store. Owned
/// by the setting; the hub of its store holds it weakly.
///
/// Thread-safe. `gate` is held while a change is judged, published and told to callbacks, so that
/// these neither overlap nor run after `close` has returned on another thread. The store is never
/// called with it but by callbacks. `mutex` is held for a few instructions.
class VELKOR_EXPORT SettingState : public std::enable_shared_from_this<SettingState> {
public:
    /// A state that does not follow a store yet. There is at least one key.
    SettingState(std::string name, std::vector<Declared> keys);
    virtual ~SettingState();

    SettingState(const SettingState&) = delete;
    SettingState& operator=(const SettingState&) = delete;

    /// Follows `store` from now on, and takes the first value. Throws `SettingError` with all
    /// complaints if there is no value, and what the store's sources throw; `close` is due then,
    /// too.
    void begin(const std::shared_ptr<configuration::ConfigurationImpl>& store)
        VELKOR_EXCLUDES(gate, mutex);

    /// Ends all deliveries: waits for one on another thread, callbacks included. The value stays.
    void close() VELKOR_EXCLUDES(gate, mutex);

    /// Takes a change of one of the keys.
    void onChange(const configuration::OptionChange& change) VELKOR_EXCLUDES(gate, mutex);

    /// Reads all keys and takes what they are now.
    void refresh() VELKOR_EXCLUDES(gate, mutex);

    /// Notes and logs why the store's newest value is unknown.
    void fail(const std::string& reason) VELKOR_EXCLUDES(mutex);

    /// Ends one callback: waits for it if it runs on another thread.
    void endCallback(std::uint64_t id) VELKOR_EXCLUDES(gate, mutex);

    /// The key, or the prefix of a struct.
    const std::string& name() const noexcept { return title; }

    const std::vector<Declared>& keys() const noexcept { return declared; }

    /// How the keys stand, in their order; none as long as there is no value.
    Standings standings() const VELKOR_EXCLUDES(mutex);

    std::optional<std::string> lastError() const VELKOR_EXCLUDES(mutex);
    bool isStoreGone() const VELKOR_EXCLUDES(mutex);

protected:
    struct Listener {
        std::uint64_t id;
        std::shared_ptr<const void> callback;
    };
    using Listeners = std::vector<Listener>;

    /// What the values of all keys, in their order, amount to. A value is kept for `publish`.
    /// `first`: there was none yet.
    virtual Verdict judge(const std::optional<configuration::Option>* options, bool first)
        VELKOR_REQUIRES(gate) = 0;

    /// Publishes the value that was judged last, and calls those of `told` that are still there.
    virtual void publish(const Listeners& told) VELKOR_REQUIRES(gate) = 0;

    /// Adds a callback, which the class that calls it knows the type of; gives its number.
    std::uint64_t addListener(std::shared_ptr<const void> callback) VELKOR_EXCLUDES(mutex);

    bool isListening(const Listener& listener) const VELKOR_EXCLUDES(mutex);

    Gate gate;

private:
    void deliver(std::uint64_t newVersion, const std::optional<configuration::Option>* options)
        VELKOR_EXCLUDES(gate, mutex);
    bool isKnown(std::uint64_t changeVersion) VELKOR_EXCLUDES(gate);
    Listeners stand(Verdict& verdict) VELKOR_EXCLUDES(mutex);
    bool isNews(const Verdict& verdict) const VELKOR_REQUIRES(mutex);
    void note(const std::string& text) VELKOR_EXCLUDES(mutex);
    std::shared_ptr<configuration::ConfigurationImpl> storeIfAlive() const VELKOR_EXCLUDES(mutex);

    const std::string title;
    const std::vector<Declared> declared;
    std::shared_ptr<Hub> hub VELKOR_GUARDED_BY(gate);
    std::uint64_t version VELKOR_GUARDED_BY(gate) = 0;
    bool hasValue VELKOR_GUARDED_BY(gate) = false;
    bool closed VELKOR_GUARDED_BY(gate) = false;

    mutable common::Mutex mutex;
    std::weak_ptr<configuration::ConfigurationImpl> followed VELKOR_GUARDED_BY(mutex);
    Standings standing VELKOR_GUARDED_BY(mutex);
    std::optional<std::string> complaint VELKOR_GUARDED_BY(mutex);
    Listeners listeners VELKOR_GUARDED_BY(mutex);
    std::uint64_t lastListener VELKOR_GUARDED_BY(mutex) = 0;
};

/// The one reference that a setting has to its state: begins to follow the store, and closes.
class VELKOR_EXPORT Following {
public:
    /// Throws as `SettingState::begin`.
    Following(std::shared_ptr<SettingState> followingState,
              const std::shared_ptr<configuration::ConfigurationImpl>& store);
    ~Following();

    Following(const Following&) = delete;
    Following& operator=(const Following&) = delete;

private:
    const std::shared_ptr<SettingState> state;
};

}  // namespace velkor::settings::detail
