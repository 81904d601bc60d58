#pragma once

#include <atomic>
#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceRequest.hpp"
#include "host/state/StateLayer.hpp"

namespace velkor::host {

/// The store of a session, whose user may lose patience: Ctrl-C ends a command that reads one value
/// after the other, and property files have a limit, those that messages name as well.
///
/// Where something lasts, what was written is to be acknowledged only when it is on disk, or
/// another machine has it: see `acknowledge`.
class SessionStore final : public configuration::ConfigurationImpl {
public:
    /// The name of the source of the layer that lasts.
    static constexpr const char* stateSource = "state";

    explicit SessionStore(const SourceLimits& sourceLimits) : limits(sourceLimits) {}

    /// Lets `layer`, which is not null, take the writes from now on, as the source "state" in the
    /// place of "override". To be called once, before the store is shared.
    void keepStateIn(std::shared_ptr<StateLayer> layer);

    /// The layer that lasts; null when there is none.
    StateLayer* state() const noexcept { return stateLayer.get(); }

    /// What the reading of a file may cost.
    const SourceLimits& sourceLimits() const noexcept { return limits; }

    /// As in the library; throws `Interrupted` once Ctrl-C was pressed, on the console's thread.
    Future<configuration::ConfigurationValue> get(const std::string& key) override;

    using Configuration::set;
    Future<configuration::ConfigurationValue> set(const std::string& key,
                                                  configuration::ConfigurationValue value) override;
    Future<configuration::ConfigurationValue> set(const std::string& key,
                                                  configuration::ConfigurationValue value,
                                                  const std::string& sourceName) override;

    /// As in the library, with the texts of `loadPropertyFile`.
    Future<bool> addPropertyFileSource(const std::string& name, const std::string& group, int order,
                                       bool readOnly, const std::u16string& path) override;

    /// Says that something is being written otherwise than by `set`.
    void noteWrite() noexcept { written = true; }

    /// Waits until all that was written since the last call is where it lasts, on disk or on
    /// another machine; returns at once when nothing was, or no source is a
    /// `configuration::DurableSource`. Throws the reason when it can't get there, and `Interrupted`
    /// when Ctrl-C was pressed meanwhile. Not to be called by what runs with the store's mutex
    /// held.
    void acknowledge();

private:
    const SourceLimits limits;
    std::shared_ptr<StateLayer> stateLayer;
    std::atomic<bool> written{false};
};

}  // namespace velkor::host
