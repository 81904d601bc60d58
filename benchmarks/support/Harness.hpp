#pragma once

#include <benchmark/benchmark.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <utility>

namespace velkor::benchmarks {

/// Runs one operation as often as asked.
using Repeat = std::function<void(std::uint64_t times)>;

/// Runs one operation and gives the seconds that it stands for, a percentile for example.
using Stated = std::function<double()>;

/// One measured operation. The program runs it in two ways: timed by Google Benchmark, or a fixed
/// number of times with its allocations and, under callgrind, its instructions counted.
struct Operation {
    std::string name;                  ///< "area/case/contender".
    std::function<Repeat()> prepare;   ///< Called once for every measurement.
    std::function<Stated()> stated;    ///< In its place for what states its time.
    std::uint64_t items = 1;           ///< How many things one run handles; results are per thing.
    std::uint64_t countedRuns = 1000;  ///< 0 for what has no repeatable count.
    bool realTime = false;
    bool weighed = false;

    Operation& perItemOf(std::uint64_t handled);
    Operation& counted(std::uint64_t runs);

    /// Other threads or processes do the work: time is what passes, and nothing is counted.
    Operation& elsewhere();

    /// Runs once only; what it leaves on the heap is stated, in bytes.
    Operation& weighsHeap();
};

/// Defined by each program: adds the operations of its area.
void addOperations();

/// Adds an operation, which the reference stays on.
Operation& add(std::string name, std::function<Repeat()> prepare);

/// Adds the operation `name`. `prepare()` makes what it needs and gives the callable to measure,
/// which is run once before measuring begins.
template <class Prepare>
Operation& measure(std::string name, Prepare prepare) {
    return add(std::move(name), [prepare]() -> Repeat {
        // Need not be copyable.
        auto run = std::make_shared<decltype(prepare())>(prepare());
        return [run](std::uint64_t times) {
            auto& once = *run;
            for (; times > 0; --times) once();
        };
    });
}

/// Adds the operation `name`, which states its time and is run once for every measurement.
Operation& addStated(std::string name, std::function<Stated()> prepare);

/// Keeps the compiler from dropping `value`.
template <class T>
void keep(T&& value) {
    benchmark::DoNotOptimize(value);
}

}  // namespace velkor::benchmarks
