// Reading one key: get, has.

#include <boost/variant/get.hpp>
#include <string>
#include <utility>

#include "benchmarks/support/FloorStore.hpp"
#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/Peers.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::size_t million = 1'000'000;

// Looks `count` keys up in turn with the callable that `makeReader` gives. In the largest table so
// many different ones that they don't stay in the caches.
template <class MakeReader>
Operation& measureReader(const std::string& name, std::size_t count, MakeReader makeReader) {
    return measure(name, [count, makeReader] {
        const std::size_t cycled = count == million ? 16'384 : 256;
        return [read = makeReader(), keys = KeyCycle(count, cycled)]() mutable {
            keep(read(keys.next()));
        };
    });
}

// The store and the floor, which have the same operations.
template <class Held>
auto getFrom(Held held) {
    return [held](const std::string& key) { return held->get(key).get(); };
}

template <class Held>
auto hasIn(Held held) {
    return [held](const std::string& key) { return held->has(key).get(); };
}

std::shared_ptr<FloorStore> floorOf(std::size_t count, const ConfigurationValue& value) {
    return std::make_shared<FloorStore>(tableOf(count, value));
}

void measureSizes() {
    for (const std::size_t count : {std::size_t{10}, std::size_t{10'000}, million}) {
        const std::string name = "get/keys:" + std::to_string(count) + "/int/";
        const std::uint64_t counted = count == million ? 0 : 1024;
        measureReader(name + "floor", count, [count] {
            return getFrom(floorOf(count, intValue()));
        }).counted(counted);
        measureReader(name + "velkor", count, [count] {
            return getFrom(singleLayerStore(count));
        }).counted(counted);
        measureReader(name + "poco", count, [count] {
            return [layers = pocoLayers(1, count, "4711")](const std::string& key) {
                return layers->getInt(key);
            };
        }).counted(counted);
    }
}

void measureOtherPeers() {
    measureReader("get/keys:10000/int/property-tree", 10'000, [] {
        return [tree = propertyTree(10'000, "4711")](const std::string& key) {
            return tree.get<int>(key);
        };
    });
    measureReader("get/keys:10000/int/key-file", 10'000, [] {
        return [file = keyFile(10'000, "4711")](const std::string& key) {
            return g_key_file_get_integer(file.get(), keyGroup.c_str(), withinGroup(key), nullptr);
        };
    });
}

void measureValues() {
    constexpr std::size_t count = 1'000;
    for (const auto& [kind, value] : otherValues()) {
        const std::string name = std::string("get/keys:1000/") + kind + "/";
        measureReader(name + "floor", count,
                      [held = value] { return getFrom(floorOf(count, held)); });
        measureReader(name + "velkor", count,
                      [held = value] { return getFrom(singleLayerStore(count, held)); });
        const auto* const text = boost::get<std::string>(&value);
        if (text == nullptr) continue;
        measureReader(name + "poco", count, [held = *text] {
            return [layers = pocoLayers(1, count, held)](const std::string& key) {
                return layers->getString(key);
            };
        });
    }
}

void measureLayers(const Layers& layers) {
    const std::string name = "get/" + layers.name() + "/";
    measureReader(name + "floor", layers.count, [layers] {
        return getFrom(std::make_shared<FloorStore>(layers.tables(), layers.grouped));
    });
    measureReader(name + "velkor", layers.count, [layers] { return getFrom(layers.store()); });
    if (layers.grouped || layers.holder == 0) return;
    measureReader(name + "poco", layers.count, [layers] {
        return [all = pocoLayers(layers.number, layers.count, "4711")](const std::string& key) {
            return all->getInt(key);
        };
    });
}

void measureHas() {
    measureReader("has/keys:10000/floor", 10'000,
                  [] { return hasIn(floorOf(10'000, intValue())); });
    measureReader("has/keys:10000/velkor", 10'000, [] { return hasIn(singleLayerStore(10'000)); });
    measureReader("has/keys:10000/poco", 10'000, [] {
        return [layers = pocoLayers(1, 10'000, "4711")](const std::string& key) {
            return layers->hasProperty(key);
        };
    });
}

}  // namespace

void addOperations() {
    measureSizes();
    measureOtherPeers();
    measureValues();
    for (const std::size_t number : {std::size_t{4}, std::size_t{16}}) {
        for (const std::size_t holder : {std::size_t{0}, number - 1}) {
            for (const bool grouped : {false, true}) {
                measureLayers({number, 1'000, holder, grouped});
            }
        }
    }
    measureHas();
}

}  // namespace velkor::benchmarks
