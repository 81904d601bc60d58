#pragma once

#include <cstddef>
#include <list>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"

namespace velkor::fuzz::http {

/// The events of a stream, kept until they are taken.
class ModelFeed {
public:
    virtual ~ModelFeed() = default;

    /// The text of the event that is next.
    virtual std::optional<std::string> next() = 0;

protected:
    /// `json` as the next event.
    std::string event(const std::string& json) {
        return "id: " + std::to_string(++lastId) + "\ndata: " + json + "\n\n";
    }

private:
    std::size_t lastId = 0;
};

/// GET /watch: the newest value that is not taken.
class ModelWatch final : public ModelFeed {
public:
    ModelWatch(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key);

    std::optional<std::string> next() override;

private:
    const std::shared_ptr<configuration::ConfigurationImpl> watched;
    const std::string watchedKey;
    std::optional<configuration::ConfigurationValue> newest;
    reactive_streams::SubscriptionHandle handle;  // the last member: it uses the others
};

/// GET /changes: the newest change of each key, the key that has waited longest first.
class ModelChanges final : public ModelFeed {
public:
    ModelChanges(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                 const std::string& prefix);

    std::optional<std::string> next() override;

private:
    std::list<configuration::OptionChange> waiting;
    reactive_streams::SubscriptionHandle handle;  // the last member: it uses the others
};

}  // namespace velkor::fuzz::http
