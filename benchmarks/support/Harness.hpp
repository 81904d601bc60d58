#pragma once

#include <benchmark/benchmark.h>
#include <valgrind/callgrind.h>

#include <cstdint>
#include <functional>
#include <string>
#include <utility>

namespace velkor::benchmarks {

/// The number of heap allocations that this process has made so far.
std::uint64_t allocationCount() noexcept;

/// One measured operation, run in two ways: timed by Google Benchmark, or a fixed number of times
/// under callgrind.
struct Operation {
    std::string name;
    std::function<void(benchmark::State&)> time;
    std::function<void(std::uint64_t repetitions)> count;
    std::uint64_t items;               ///< How many things one run handles.
    std::uint64_t countedRepetitions;  ///< How many runs are counted under callgrind.
};

/// Adds `operation` to those that the program's main function runs.
void add(Operation operation);

/// Adds the operation `name`. `prepare()` makes what it needs and returns the callable to measure;
/// it is called once for every measurement. `items` is how many things one call handles: the time
/// and the counters are stated for each of them.
template <class Prepare>
void measure(const std::string& name, Prepare prepare, std::uint64_t items = 1,
             std::uint64_t countedRepetitions = 1000) {
    const auto time = [prepare, items](benchmark::State& state) {
        auto run = prepare();
        run();
        const std::uint64_t before = allocationCount();
        for (auto _ : state) run();
        const auto handled = static_cast<double>(state.iterations()) * static_cast<double>(items);
        state.counters["allocations"] = static_cast<double>(allocationCount() - before) / handled;
        state.counters["items"] = static_cast<double>(items);
    };
    const auto count = [prepare](std::uint64_t repetitions) {
        auto run = prepare();
        run();
        CALLGRIND_ZERO_STATS;
        CALLGRIND_TOGGLE_COLLECT;
        for (std::uint64_t i = 0; i < repetitions; ++i) run();
        CALLGRIND_TOGGLE_COLLECT;
    };
    add({name, time, count, items, countedRepetitions});
}

/// Keeps the compiler from dropping `value`.
template <class T>
void keep(T&& value) {
    benchmark::DoNotOptimize(value);
}

}  // namespace velkor::benchmarks
