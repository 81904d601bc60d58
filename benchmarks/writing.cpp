// Writing one key: set, beside watches and without any.

#include <string>
#include <utility>

#include "benchmarks/support/CountingSubscriber.hpp"
#include "benchmarks/support/FloorStore.hpp"
#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/Peers.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::size_t keyCount = 10'000;

// Writes keys in turn with the callable that `makeWriter` gives.
template <class MakeWriter>
Operation& measureWriter(const std::string& name, MakeWriter makeWriter) {
    return measure(name, [makeWriter] {
        return [write = makeWriter(), keys = KeyCycle(keyCount)]() mutable { write(keys.next()); };
    });
}

template <class Held>
auto setIn(Held held, const ConfigurationValue& value) {
    return [held, value](const std::string& key) { keep(held->set(key, value).get()); };
}

// Each of the keys that are written has a subscriber that waits for its next value.
Store watchedStore() {
    Store store = singleLayerStore(keyCount);
    for (std::size_t i = 0; i < keyCount; ++i) {
        store->watchOption(keyNumber(i))->subscribe(std::make_shared<CountingSubscriber>());
    }
    return store;
}

// Nothing that is written is watched, but much else is.
Store storeBesideWatches(std::size_t watches) {
    Store store = singleLayerStore(keyCount);
    for (std::size_t i = 0; i < watches; ++i) {
        store->watchOption(keyNumber(keyCount + i))
            ->subscribe(std::make_shared<CountingSubscriber>());
    }
    return store;
}

void measureValue(const std::string& kind, const ConfigurationValue& value) {
    measureWriter("set/" + kind + "/floor", [value] {
        return setIn(std::make_shared<FloorStore>(tableOf(keyCount, value)), value);
    });
    measureWriter("set/" + kind + "/velkor",
                  [value] { return setIn(singleLayerStore(keyCount, value), value); });
}

void measureWatched() {
    measureWriter("set/watched/velkor", [] { return setIn(watchedStore(), intValue()); });
    measureWriter("set/beside-100000-watches/velkor",
                  [] { return setIn(storeBesideWatches(100'000), intValue()); });
}

void measurePeers() {
    measureWriter("set/int/poco", [] {
        return [layers = pocoLayers(1, keyCount, "4711")](const std::string& key) mutable {
            layers->setInt(key, 4711);
        };
    });
    measureWriter("set/int/property-tree", [] {
        return [tree = propertyTree(keyCount, "4711")](const std::string& key) mutable {
            tree.put(key, 4711);
        };
    });
    measureWriter("set/int/key-file", [] {
        return [file = keyFile(keyCount, "4711")](const std::string& key) {
            g_key_file_set_integer(file.get(), keyGroup.c_str(), withinGroup(key), 4711);
        };
    });
}

}  // namespace

void addOperations() {
    measureValue("int", intValue());
    for (const auto& [kind, value] : otherValues()) {
        measureValue(kind, value);
    }
    measureWatched();
    measurePeers();
}

}  // namespace velkor::benchmarks
