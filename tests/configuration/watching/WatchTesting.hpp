#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/FreeMutex.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::configuration {

/// A store whose inner members the tests can reach.
class OpenStore : public ConfigurationImpl {
public:
    using ConfigurationImpl::mutex;
    using ConfigurationImpl::removeStream;
    using ConfigurationImpl::updatePublishers;

    /// Whether another thread would get the mutex now, without waiting.
    bool isFreeForOthers() { return velkor::testing::isFreeForOthers(mutex); }
};

/// One watch: its stream and a subscriber that keeps what it delivers.
struct Watch {
    using Recorder = velkor::testing::RecordingSubscriber<ConfigurationValue>;

    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> publisher;
    std::shared_ptr<Recorder> subscriber = std::make_shared<Recorder>();

    void subscribe(std::uint64_t demand) const {
        publisher->subscribe(subscriber);
        if (demand > 0) subscriber->request(demand);
    }

    /// The delivered values with their kinds.
    std::vector<std::string> values() const {
        std::vector<std::string> texts;
        for (const auto& value : subscriber->values) {
            texts.push_back(velkor::testing::textOf(value));
        }
        return texts;
    }
};

/// A store and short ways to watch it.
class WatchTest : public velkor::testing::StoreTest {
protected:
    WatchTest() { store = open; }

    /// A watch of `key` whose subscriber has asked for `demand` values.
    Watch watch(const std::string& key, std::uint64_t demand = velkor::testing::allValues) const {
        const Watch started{open->watchOption(key)};
        started.subscribe(demand);
        return started;
    }

    void set(const std::string& key, int value) const { open->set(key, value).get(); }

    std::shared_ptr<OpenStore> open = std::make_shared<OpenStore>();
};

}  // namespace velkor::configuration
