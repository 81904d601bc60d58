#include "benchmarks/support/Harness.hpp"

#include <valgrind/callgrind.h>

#include <cstring>
#include <deque>
#include <future>
#include <iostream>
#include <thread>

#include "benchmarks/support/Heap.hpp"

namespace velkor::benchmarks {

namespace {

// A thread that only waits while this lives. Standard library and heap leave atomic operations out
// as long as a process has one thread, which no host of a thread-safe store does.
class SecondThread {
public:
    SecondThread() : thread([this] { ended.get_future().wait(); }) {}
    ~SecondThread() {
        ended.set_value();
        thread.join();
    }

private:
    std::promise<void> ended;
    std::thread thread;  // the last member: it uses the other
};

std::deque<Operation>& operations() {
    static std::deque<Operation> all;
    return all;
}

void time(const Operation& operation, benchmark::State& state) {
    const Repeat repeat = operation.prepare();
    if (!operation.weighed) repeat(1);
    const std::uint64_t allocationsBefore = allocationCount();
    const std::uint64_t bytesBefore = heapBytes();
    while (state.KeepRunningBatch(state.max_iterations)) {
        repeat(static_cast<std::uint64_t>(state.max_iterations));
    }
    const auto handled =
        static_cast<double>(state.iterations()) * static_cast<double>(operation.items);
    state.counters["items"] = static_cast<double>(operation.items);
    state.counters["allocations"] =
        static_cast<double>(allocationCount() - allocationsBefore) / handled;
    if (operation.weighed) {
        state.counters["bytes"] = static_cast<double>(heapBytes() - bytesBefore) / handled;
    }
}

void registerStated(const Operation& operation) {
    benchmark::RegisterBenchmark(operation.name.c_str(),
                                 [&operation](benchmark::State& state) {
                                     const Stated run = operation.stated();
                                     while (state.KeepRunning()) state.SetIterationTime(run());
                                     state.counters["items"] = 1;
                                 })
        ->UseManualTime()
        ->Iterations(1);
}

void registerForTiming(const Operation& operation) {
    if (operation.stated) return registerStated(operation);
    auto* const registered = benchmark::RegisterBenchmark(
        operation.name.c_str(), [&operation](benchmark::State& state) { time(operation, state); });
    if (operation.realTime) registered->UseRealTime();
    if (operation.weighed) registered->Iterations(1);
}

// Prints a line of name, things handled, allocations and heap growth, and has callgrind, when it is
// there, write the instructions into a file of their own that states the name.
void count(const Operation& operation) {
    const Repeat repeat = operation.prepare();
    if (!operation.weighed) repeat(1);
    const std::uint64_t allocationsBefore = allocationCount();
    const std::uint64_t bytesBefore = heapBytes();
    CALLGRIND_START_INSTRUMENTATION;
    repeat(operation.countedRuns);
    CALLGRIND_STOP_INSTRUMENTATION;
    const std::uint64_t allocations = allocationCount() - allocationsBefore;
    const std::uint64_t bytes = operation.weighed ? heapBytes() - bytesBefore : 0;
    CALLGRIND_DUMP_STATS_AT(operation.name.c_str());
    std::cout << operation.name << '\t' << operation.countedRuns * operation.items << '\t'
              << allocations << '\t' << bytes << std::endl;
}

int countAll() {
    for (const Operation& operation : operations()) {
        if (operation.countedRuns > 0) count(operation);
    }
    return 0;
}

int timeAll(int argc, char** argv) {
    for (const Operation& operation : operations()) registerForTiming(operation);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}

}  // namespace

Operation& Operation::perItemOf(std::uint64_t handled) {
    items = handled;
    return *this;
}

Operation& Operation::counted(std::uint64_t runs) {
    countedRuns = runs;
    return *this;
}

Operation& Operation::elsewhere() {
    realTime = true;
    return counted(0);
}

Operation& Operation::weighsHeap() {
    weighed = true;
    return counted(1);
}

Operation& add(std::string name, std::function<Repeat()> prepare) {
    Operation& added = operations().emplace_back();
    added.name = std::move(name);
    added.prepare = std::move(prepare);
    return added;
}

Operation& addStated(std::string name, std::function<Stated()> prepare) {
    Operation& added = add(std::move(name), nullptr);
    added.stated = std::move(prepare);
    return added.elsewhere();
}

}  // namespace velkor::benchmarks

int main(int argc, char** argv) {
    using namespace velkor::benchmarks;
    const SecondThread second;
    addOperations();
    const bool counts = argc == 2 && std::strcmp(argv[1], "--count") == 0;
    return counts ? countAll() : timeAll(argc, argv);
}
