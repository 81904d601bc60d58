#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"

namespace velkor::benchmarks {
namespace {

[[maybe_unused]] const bool registered = [] {
    measure("get/floor/10000", [] {
        auto floor = std::make_shared<FloorStore>(tableOf(10'000, intValue()));
        return [floor, keys = KeyCycle(10'000)]() mutable { keep(floor->get(keys.next()).get()); };
    });
    measure("get/store/1-layer/10000", [] {
        return [store = singleLayerStore(10'000), keys = KeyCycle(10'000)]() mutable {
            keep(store->get(keys.next()).get());
        };
    });
    measure("get/store/16-layers/groups", [] {
        return [store = layeredStore(16, 1'000, true), keys = KeyCycle(1'000)]() mutable {
            keep(store->get(keys.next()).get());
        };
    });
    measure("has/store/1-layer/10000", [] {
        return [store = singleLayerStore(10'000), keys = KeyCycle(10'000)]() mutable {
            keep(store->has(keys.next()).get());
        };
    });
    measure("set/floor/10000", [] {
        auto floor = std::make_shared<FloorStore>(tableOf(10'000, intValue()));
        return
            [floor, keys = KeyCycle(10'000)]() mutable { keep(floor->set(keys.next(), 5).get()); };
    });
    measure("set/store/1-layer/10000", [] {
        return [store = singleLayerStore(10'000), keys = KeyCycle(10'000)]() mutable {
            keep(store->set(keys.next(), 5).get());
        };
    });
    return true;
}();

}  // namespace
}  // namespace velkor::benchmarks
