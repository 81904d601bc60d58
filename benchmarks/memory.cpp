// What a key and an idle watch occupy on the heap.

#include <memory>
#include <string>
#include <utility>

#include "benchmarks/support/CountingSubscriber.hpp"
#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::size_t count = 100'000;

// Weighs what `build` makes of what `prepare` gives, for each of `count` things.
template <class Prepare, class Build>
void weigh(const std::string& name, Prepare prepare, Build build) {
    measure(name,
            [prepare, build] {
                using Given = decltype(prepare());
                using Built = decltype(build(std::declval<Given&>()));
                return [given = prepare(), build, built = std::unique_ptr<Built>()]() mutable {
                    built = std::make_unique<Built>(build(given));
                };
            })
        .perItemOf(count)
        .weighsHeap();
}

const auto nothing = [] { return 0; };

Store openWatches(const Store& store, bool subscribed) {
    for (std::size_t i = 0; i < count; ++i) {
        const auto watch = store->watchOption(keyNumber(i));
        if (subscribed) watch->subscribe(std::make_shared<CountingSubscriber>());
    }
    return store;
}

}  // namespace

void addOperations() {
    weigh("memory/key/floor", nothing, [](int) { return tableOf(count); });
    weigh("memory/key/velkor", nothing, [](int) { return singleLayerStore(count); });
    for (const bool subscribed : {false, true}) {
        weigh(subscribed ? "memory/subscribed-watch/velkor" : "memory/idle-watch/velkor",
              emptyStore,
              [subscribed](const Store& store) { return openWatches(store, subscribed); });
    }
}

}  // namespace velkor::benchmarks
