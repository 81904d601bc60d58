// Promise and future on one thread.

#include <string>

#include "benchmarks/support/FutureWays.hpp"
#include "benchmarks/support/Harness.hpp"

namespace velkor::benchmarks {

namespace {

constexpr auto plusOne = [](auto&& future) { return future.get() + 1; };

template <class Way>
void measureReady() {
    measure(std::string("future/ready/") + Way::name,
            [] { return [] { keep(Way::ready().get()); }; });
}

template <class Way>
void measureResolve() {
    measure(std::string("future/promise/") + Way::name, [] {
        return [] {
            typename Way::Promise promise;
            auto future = Way::futureOf(promise);
            Way::resolve(promise);
            keep(future.get());
        };
    });
}

// Attached before and after the result is there.
template <class Way>
void measureThen() {
    measure(std::string("future/then-ready/") + Way::name,
            [] { return [] { keep(Way::ready().then(plusOne).get()); }; });
    measure(std::string("future/then-pending/") + Way::name, [] {
        return [] {
            typename Way::Promise promise;
            auto next = Way::futureOf(promise).then(plusOne);
            Way::resolve(promise);
            keep(next.get());
        };
    });
}

}  // namespace

void addOperations() {
    measureReady<Floor>();
    measureReady<Velkor>();
    measureReady<Boost>();
    measureResolve<Floor>();
    measureResolve<Velkor>();
    measureResolve<Std>();
    measureResolve<Boost>();
    measureThen<Floor>();
    measureThen<Velkor>();
}

}  // namespace velkor::benchmarks
