// Values in etcd: reading them beside values that are nowhere else, starting, writing, and what
// they occupy. Starts a member of etcd on the loopback interface, with its data in memory.

#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"
#include "layers/etcd/EtcdSource.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Gateway.hpp"
#include "layers/etcd/detail/Requests.hpp"
#include "layers/etcd/detail/Stop.hpp"
#include "layers/etcd/detail/ValueText.hpp"
#include "settings/Setting.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"

namespace velkor::benchmarks {

namespace {

using layers::EtcdOptions;
using layers::EtcdSource;
using settings::Setting;
using testing::EtcdCluster;

constexpr std::size_t many = 10'000;
constexpr std::size_t keysOfApply = 100;
constexpr std::size_t reads = 1000;
const std::string prefix = "many/";
const std::string textKey = "service.text";

std::string text40() {
    return std::string(40, 'x');
}

// A member that has many keys.
class Server {
public:
    Server() {
        const auto source = open();
        const auto store = emptyStore();
        store->addSource("etcd", "", 0, false, source).get();
        std::vector<configuration::Change> changes{{textKey, ConfigurationValue(text40())}};
        for (std::size_t i = 0; i < many; ++i) {
            changes.push_back({keyNumber(i), intValue()});
            if (changes.size() < keysOfApply && i + 1 < many) continue;
            store->apply(changes).get();
            changes.clear();
        }
        source->committed().get();
    }

    std::shared_ptr<EtcdSource> open(const std::string& below = prefix) const {
        return EtcdSource::open(cluster.urls(), below);
    }

    const std::vector<layers::etcd::Endpoint>& endpoints() const { return where; }

private:
    const EtcdCluster cluster;
    const std::vector<layers::etcd::Endpoint> where = layers::etcd::toEndpoints(cluster.urls());
};

// One for all operations, until the program ends.
const Server& server() {
    static const Server only;
    return only;
}

Store storeInEtcd() {
    auto store = emptyStore();
    store->addSource("etcd", "", 0, false, server().open()).get();
    return store;
}

Store storeInMemory() {
    auto store = singleLayerStore(many);
    store->set(textKey, text40());
    return store;
}

template <class MakeStore>
void measureReading(const std::string& contender, MakeStore makeStore) {
    measure("etcd/get/keys:10000/" + contender, [makeStore] {
        return [store = makeStore(), keys = KeyCycle(many)]() mutable {
            keep(store->get(keys.next()).get());
        };
    });
    measure("etcd/setting/int/" + contender,
            [makeStore] {
                const auto store = makeStore();
                return [store, setting = std::make_shared<Setting<int>>(store, keyNumber(0))] {
                    for (std::size_t i = 0; i < reads; ++i) keep(setting->get());
                };
            })
        .perItemOf(reads)
        .counted(100);
    measure("etcd/setting/text40/" + contender,
            [makeStore] {
                const auto store = makeStore();
                const auto setting = std::make_shared<Setting<std::string>>(store, textKey);
                return [store, setting, reader = setting->reader()]() mutable {
                    for (std::size_t i = 0; i < reads; ++i) keep(reader.get().size());
                };
            })
        .perItemOf(reads)
        .counted(100);
}

// A connection without anything around it.
class Bare {
public:
    std::string ask(const char* path, const std::string& request) {
        return gateway.ask(path, request, layers::etcd::Link::Time::max());
    }

private:
    const EtcdOptions options{};
    const layers::etcd::Stop stop;
    layers::etcd::Gateway gateway{server().endpoints().front(), options, stop,
                                  layers::etcd::Link::Time::max()};
};

void measureStarting() {
    measure("etcd/start/keys:10000/velkor", [] {
        return [] { keep(server().open()); };
    }).elsewhere();
    measure("etcd/start/keys:10000/range", [] {
        return [] { keep(Bare().ask("/v3/kv/range", layers::etcd::rangeRequest(prefix)).size()); };
    }).elsewhere();
}

// Each acknowledged before the next.
void measureWriting() {
    measure("etcd/set/velkor", [] {
        const auto source = server().open("set/");
        return [source, value = 0]() mutable {
            source->set("velkor", ++value);
            keep(source->committed().get());
        };
    }).elsewhere();
    measure("etcd/set/transaction", [] {
        return [bare = std::make_shared<Bare>(), value = 0]() mutable {
            layers::etcd::KeyChange change{"set/bare"};
            change.value = layers::etcd::toValueText(++value);
            keep(bare->ask("/v3/kv/txn", layers::etcd::transactionRequest({change}, false)));
        };
    }).elsewhere();
}

void measureMemory() {
    measure("etcd/memory/velkor",
            [] {
                return [&member = server(), built = std::shared_ptr<EtcdSource>()]() mutable {
                    built = member.open();
                };
            })
        .perItemOf(many)
        .weighsHeap();
}

}  // namespace

void addOperations() {
    measureReading("velkor", storeInEtcd);
    measureReading("plain", storeInMemory);
    measureStarting();
    measureWriting();
    measureMemory();
}

}  // namespace velkor::benchmarks
