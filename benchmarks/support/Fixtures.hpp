#pragma once

#include <cstddef>
#include <cstdio>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/ConfigurationValue.hpp"

namespace velkor::benchmarks {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::ValueMap;

/// A realistic key of about 30 characters.
inline std::string keyNumber(std::size_t number) {
    char text[64];
    std::snprintf(text, sizeof text, "service.pool%02zu.worker.limit%06zu", number % 97, number);
    return text;
}

/// Keys to take in turn, spread over a table of `count`, so that no look-up profits from the one
/// before it.
class KeyCycle {
public:
    explicit KeyCycle(std::size_t count) {
        constexpr std::size_t cycled = 256;
        for (std::size_t i = 0; i < cycled; ++i) keys.push_back(keyNumber(i * 7919 % count));
    }

    const std::string& next() { return keys[position++ % keys.size()]; }

private:
    std::vector<std::string> keys;
    std::size_t position = 0;
};

/// The values that keys hold here.
inline ConfigurationValue intValue() {
    return 4711;
}
inline ConfigurationValue shortText() {
    return std::string(16, 's');
}
inline ConfigurationValue longText() {
    return std::string(200, 'l');
}
inline ConfigurationValue thousandDoubles() {
    return std::vector<double>(1000, 0.5);
}

/// A table of `count` keys that all hold `value`.
inline ValueMap tableOf(std::size_t count, const ConfigurationValue& value) {
    ValueMap table;
    table.reserve(count);
    for (std::size_t i = 0; i < count; ++i) table.emplace(keyNumber(i), value);
    return table;
}

/// A store of one source only, which holds `count` keys.
inline std::shared_ptr<ConfigurationImpl> singleLayerStore(
    std::size_t count, const ConfigurationValue& value = intValue()) {
    auto store = std::make_shared<ConfigurationImpl>();
    store->removeSource("default").get();
    store->removeSource("override").get();
    store->addInMemorySource("only", "", 0, false, tableOf(count, value)).get();
    return store;
}

/// A store of `layers` sources of `count` keys each, of which only the last one has the keys of
/// `tableOf`. With `groups` every source is registered under one that all these keys begin with.
inline std::shared_ptr<ConfigurationImpl> layeredStore(std::size_t layers, std::size_t count,
                                                       bool groups) {
    auto store = std::make_shared<ConfigurationImpl>();
    store->removeSource("default").get();
    store->removeSource("override").get();
    for (std::size_t layer = 0; layer < layers; ++layer) {
        ValueMap table;
        for (std::size_t i = 0; i < count; ++i) {
            const std::string key = keyNumber(i) + (layer + 1 == layers ? "" : "x");
            table.emplace(groups ? key.substr(8) : key, intValue());
        }
        store
            ->addInMemorySource("layer" + std::to_string(layer), groups ? "service" : "",
                                static_cast<int>(layer), false, std::move(table))
            .get();
    }
    return store;
}

/// What every read of the store costs at least: a bare table under an uncontended recursive mutex
/// and a future's two allocations.
class FloorStore {
public:
    explicit FloorStore(ValueMap table) : values(std::move(table)) {}

    Future<ConfigurationValue> get(const std::string& key) {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        return makeReadyFuture(ConfigurationValue(values.find(key)->second));
    }

    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        return makeReadyFuture(std::exchange(values.find(key)->second, std::move(value)));
    }

private:
    std::recursive_mutex mutex;
    ValueMap values;
};

}  // namespace velkor::benchmarks
