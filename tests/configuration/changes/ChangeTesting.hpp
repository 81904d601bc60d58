#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/Changes.hpp"
#include "tests/configuration/watching/WatchTesting.hpp"

namespace velkor::configuration {

/// One stream of changes and a subscriber that keeps what it delivers.
struct ChangeWatch {
    using Recorder = velkor::testing::RecordingSubscriber<OptionChange>;

    /// What was delivered, as "key=value@source" or "key gone".
    std::vector<std::string> texts() const {
        std::vector<std::string> all;
        for (const auto& change : subscriber->values) all.push_back(textOf(change));
        return all;
    }

    static std::string textOf(const OptionChange& change) {
        if (!change.option) return change.key + " gone";
        return change.option->key + "=" + velkor::testing::textOf(change.option->value) + "@" +
               change.option->source;
    }

    std::shared_ptr<reactive_streams::PublisherAPI<OptionChange>> publisher;
    std::shared_ptr<Recorder> subscriber = std::make_shared<Recorder>();
};

/// A store and short ways to follow its changes.
class ChangeTest : public WatchTest {
protected:
    /// The changes of the keys that `prefix` begins; the subscriber has asked for `demand`.
    ChangeWatch follow(const std::string& prefix,
                       std::uint64_t demand = velkor::testing::allValues) const {
        ChangeWatch started{open->watchChanges(prefix)};
        started.publisher->subscribe(started.subscriber);
        if (demand > 0) started.subscriber->request(demand);
        return started;
    }

    std::uint64_t version() const { return open->read({}).get().version; }
};

}  // namespace velkor::configuration
