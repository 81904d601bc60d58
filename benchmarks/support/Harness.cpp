#include "benchmarks/support/Harness.hpp"

#include <cstdlib>
#include <cstring>
#include <iostream>
#include <new>
#include <vector>

namespace velkor::benchmarks {

namespace {

std::uint64_t allocations = 0;

std::vector<Operation>& operations() {
    static std::vector<Operation> all;
    return all;
}

// Runs every operation under callgrind and has its instructions written to a file of their own,
// which begins with the operation's name.
int countInstructions() {
    for (const Operation& operation : operations()) {
        operation.count(operation.countedRepetitions);
        CALLGRIND_DUMP_STATS_AT(operation.name.c_str());
        std::cout << operation.name << ' ' << operation.countedRepetitions * operation.items
                  << '\n';
    }
    return 0;
}

}  // namespace

std::uint64_t allocationCount() noexcept {
    return allocations;
}

void add(Operation operation) {
    operations().push_back(std::move(operation));
}

}  // namespace velkor::benchmarks

void* operator new(std::size_t size) {
    ++velkor::benchmarks::allocations;
    if (void* memory = std::malloc(size == 0 ? 1 : size)) return memory;
    throw std::bad_alloc();
}

void operator delete(void* memory) noexcept {
    std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}

int main(int argc, char** argv) {
    using namespace velkor::benchmarks;
    if (argc == 2 && std::strcmp(argv[1], "--count-instructions") == 0) return countInstructions();
    for (const Operation& operation : operations()) {
        benchmark::RegisterBenchmark(operation.name.c_str(), operation.time);
    }
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
