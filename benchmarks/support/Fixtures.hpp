#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/ConfigurationValue.hpp"

namespace velkor::benchmarks {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::ValueMap;

using Store = std::shared_ptr<ConfigurationImpl>;

/// The group that every key begins with, as a source is registered under it.
inline const std::string keyGroup = "service";

/// A realistic key of 30 characters, the group and its dot included.
inline std::string keyNumber(std::size_t number) {
    char text[64];
    std::snprintf(text, sizeof text, "%s.pool%02zu.worker.limit%06zu", keyGroup.c_str(),
                  number % 97, number);
    return text;
}

/// The same key within its group.
inline std::string relativeKeyNumber(std::size_t number) {
    return keyNumber(number).substr(keyGroup.size() + 1);
}

/// Strings to take in turn, spread over a table of `count`, so that no look-up profits from the one
/// before it.
class KeyCycle {
public:
    /// Takes `cycled` different ones, a power of two.
    explicit KeyCycle(std::size_t count, std::size_t cycled = 256) : mask(cycled - 1) {
        for (std::size_t i = 0; i < cycled; ++i) keys.push_back(keyNumber(i * 7919 % count));
    }

    const std::string& next() { return keys[position++ & mask]; }

private:
    std::vector<std::string> keys;
    std::size_t mask;
    std::size_t position = 0;
};

/// One of the values that keys hold here.
struct NamedValue {
    const char* name;
    ConfigurationValue value;
};

inline ConfigurationValue intValue() {
    return 4711;
}

inline std::vector<NamedValue> otherValues() {
    return {{"text16", std::string(16, 's')},
            {"text200", std::string(200, 'l')},
            {"doubles1000", std::vector<double>(1000, 0.5)}};
}

/// A table of `count` keys that all hold `value`.
inline ValueMap tableOf(std::size_t count, const ConfigurationValue& value = intValue()) {
    ValueMap table;
    table.reserve(count);
    for (std::size_t i = 0; i < count; ++i) table.emplace(keyNumber(i), value);
    return table;
}

/// A store without any source.
inline Store emptyStore() {
    auto store = std::make_shared<ConfigurationImpl>();
    store->removeSource("default").get();
    store->removeSource("override").get();
    return store;
}

/// A store of one source only, which holds `count` keys.
inline Store singleLayerStore(std::size_t count, const ConfigurationValue& value = intValue()) {
    Store store = emptyStore();
    store->addInMemorySource("only", "", 0, false, tableOf(count, value)).get();
    return store;
}

/// Several tables of `count` keys each, one above the other.
struct Layers {
    std::size_t number;
    std::size_t count;
    std::size_t
        holder;    ///< The one that has the keys of `keyNumber`; the others have none of them.
    bool grouped;  ///< Each is registered under `keyGroup`.

    /// The table of one of them, keys without the group where it is grouped.
    ValueMap table(std::size_t layer) const {
        ValueMap values;
        values.reserve(count);
        const std::string mark = layer == holder ? "" : "." + std::to_string(layer);
        for (std::size_t i = 0; i < count; ++i) {
            values.emplace((grouped ? relativeKeyNumber(i) : keyNumber(i)) + mark, intValue());
        }
        return values;
    }

    std::vector<ValueMap> tables() const {
        std::vector<ValueMap> all;
        for (std::size_t layer = 0; layer < number; ++layer) all.push_back(table(layer));
        return all;
    }

    Store store() const {
        Store all = emptyStore();
        for (std::size_t layer = 0; layer < number; ++layer) {
            all->addInMemorySource("layer" + std::to_string(layer), grouped ? keyGroup : "",
                                   static_cast<int>(layer), false, table(layer))
                .get();
        }
        return all;
    }

    /// As in an operation's name: "layers:16/last/grouped".
    std::string name() const {
        return "layers:" + std::to_string(number) + (holder == 0 ? "/first" : "/last") +
               (grouped ? "/grouped" : "/bare");
    }
};

}  // namespace velkor::benchmarks
