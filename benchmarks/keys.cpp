// All keys: keys, and the list that an operator sees.

#include <algorithm>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "benchmarks/support/CommandTable.hpp"
#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"
#include "configuration/admin/ConfigurationCommandProvider.hpp"

namespace velkor::benchmarks {

namespace {

std::set<std::string> sortedKeys(const ValueMap& table) {
    std::set<std::string> sorted;
    for (const auto& entry : table) sorted.insert(entry.first);
    return sorted;
}

// What all keys cost at least: those of each layer, sorted, put into one set. No key is copied for
// that, and it grows once where there is a prefix.
std::set<std::string> floorKeys(const std::vector<ValueMap>& tables, const std::string& prefix) {
    std::set<std::string> all;
    for (const auto& table : tables) {
        std::set<std::string> sorted = sortedKeys(table);
        while (!sorted.empty()) {
            auto key = sorted.extract(sorted.begin());
            if (!prefix.empty()) key.value().insert(0, prefix);
            all.insert(std::move(key));
        }
    }
    return all;
}

void measureSingleLayer(std::size_t count) {
    const std::string name = "keys/layers:1/bare/keys:" + std::to_string(count);
    const std::uint64_t runs = std::max<std::uint64_t>(1, 10'000 / count);
    measure(name + "/floor",
            [count] { return [table = tableOf(count)] { keep(sortedKeys(table)); }; })
        .perItemOf(count)
        .counted(runs);
    measure(name + "/velkor",
            [count] { return [store = singleLayerStore(count)] { keep(store->keys().get()); }; })
        .perItemOf(count)
        .counted(runs);
}

void measureLayers(const Layers& layers) {
    const std::string name = "keys/" + layers.name();
    const std::uint64_t handled = layers.number * layers.count;
    measure(name + "/floor",
            [layers] {
                return [tables = layers.tables(), prefix = layers.grouped ? keyGroup + "." : ""] {
                    keep(floorKeys(tables, prefix));
                };
            })
        .perItemOf(handled)
        .counted(2);
    measure(name + "/velkor",
            [layers] { return [store = layers.store()] { keep(store->keys().get()); }; })
        .perItemOf(handled)
        .counted(2);
}

void measureList(std::size_t count) {
    const std::string name = "list/keys:" + std::to_string(count);
    measure(name + "/keys-and-gets",
            [count] {
                return [store = singleLayerStore(count)] {
                    for (const auto& key : store->keys().get()) keep(store->get(key).get());
                };
            })
        .perItemOf(count)
        .counted(1);
    measure(name + "/velkor",
            [count] {
                const Store store = singleLayerStore(count);
                auto commands = std::make_shared<CommandTable>();
                auto provider =
                    std::make_shared<configuration::ConfigurationCommandProvider>(store, commands);
                return [commands, provider] { keep(commands->run("velkor.configuration.list")); };
            })
        .perItemOf(count)
        .counted(1);
}

}  // namespace

void addOperations() {
    for (const std::size_t count : {10U, 10'000U}) measureSingleLayer(count);
    measureLayers({4, 10'000, 3, false});
    measureLayers({4, 10'000, 3, true});
    measureLayers({16, 1'000, 15, true});
    for (const std::size_t count : {10'000U, 100'000U}) measureList(count);
}

}  // namespace velkor::benchmarks
