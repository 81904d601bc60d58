// Promise and future between two threads.

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "benchmarks/support/FutureWays.hpp"
#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/Messenger.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::size_t batch = 256;

template <class Way>
void resolveAll(std::vector<typename Way::Promise>& promises) {
    for (auto& promise : promises) Way::resolve(promise);
}

// This thread waits for one result after the other while another thread resolves them.
template <class Way>
void measureHandover() {
    measure(std::string("future/two-threads/") + Way::name,
            [] {
                using Promises = std::vector<typename Way::Promise>;
                return [other = std::make_unique<Messenger<Promises>>(&resolveAll<Way>)] {
                    Promises promises(batch);
                    std::vector<decltype(Way::futureOf(promises[0]))> futures;
                    for (auto& promise : promises) futures.push_back(Way::futureOf(promise));
                    other->send(promises);
                    for (auto& future : futures) keep(future.get());
                    other->waitUntilDone();
                };
            })
        .perItemOf(batch)
        .elsewhere();
}

}  // namespace

void addOperations() {
    measureHandover<Floor>();
    measureHandover<Velkor>();
    measureHandover<Std>();
    measureHandover<Boost>();
}

}  // namespace velkor::benchmarks
