#pragma once

#include <gtest/gtest.h>
#include <pthread.h>

#include <cstddef>
#include <exception>
#include <new>
#include <optional>
#include <ostream>
#include <stdexcept>

#include "tests/support/AllocationCounter.hpp"

namespace velkor::testing {

/// What can go wrong inside an operation: that it gets no memory, or that the code of others that
/// it calls throws. Either once, or from then on.
enum class Trouble { memoryOnce, memoryForGood, foreignOnce, foreignForGood };

/// What code of others throws when its turn has come.
class ForeignFailure : public std::runtime_error {
public:
    ForeignFailure() : std::runtime_error("foreign code has failed") {}
};

/// Called by all code of others that a row hands to the library: sources, subscribers, hooks,
/// continuations, sinks, clocks. Throws `ForeignFailure` when it is the turn of this call.
void foreignCall();

/// Lets calls of `foreignCall` on this thread throw while it lives, as `AllocationFailure` lets
/// allocations fail.
class ForeignTrouble {
public:
    ForeignTrouble(std::size_t successes, Shortage kind) noexcept;
    ~ForeignTrouble();

    ForeignTrouble(const ForeignTrouble&) = delete;
    ForeignTrouble& operator=(const ForeignTrouble&) = delete;

    bool hasHappened() const noexcept;
};

/// One run of a row, whose trouble comes after some things that go well.
class Trial {
public:
    /// Nothing goes wrong where there is no `trouble`.
    Trial(std::optional<Trouble> trouble, std::size_t goingWell)
        : kind(trouble), successes(goingWell) {}

    /// Runs `operation` in trouble and says whether it got through: false when what went wrong left
    /// it as an exception. What happens before and after goes well. To be called once.
    template <class Operation>
    bool passes(Operation&& operation) {
        if (!kind) return ends(operation);
        const bool once = *kind == Trouble::memoryOnce || *kind == Trouble::foreignOnce;
        const Shortage shortage = once ? Shortage::once : Shortage::lasting;
        return isOfMemory() ? passesIn(AllocationFailure(successes, shortage), operation)
                            : passesIn(ForeignTrouble(successes, shortage), operation);
    }

    /// Whether the operation came as far as its trouble.
    bool hasStruck() const noexcept { return struck; }

    /// Whether memory is what is short.
    bool isOfMemory() const noexcept {
        return kind == Trouble::memoryOnce || kind == Trouble::memoryForGood;
    }

    /// Whether the trouble lasts until the end of the operation.
    bool isLasting() const noexcept {
        return kind == Trouble::memoryForGood || kind == Trouble::foreignForGood;
    }

private:
    template <class Failure, class Operation>
    bool passesIn(const Failure& failure, Operation&& operation) {
        const bool passed = ends(operation);
        struck = failure.hasHappened();
        return passed;
    }

    template <class Operation>
    static bool ends(Operation&& operation) {
        try {
            operation();
            return true;
        } catch (const std::bad_alloc&) {
            return false;
        } catch (const ForeignFailure&) {
            return false;
        }
    }

    std::optional<Trouble> kind;
    std::size_t successes;
    bool struck = false;
};

/// An operation, how it is called, and what holds when it did not get through, and when it did.
struct Row {
    const char* name;
    void (*run)(Trial&);
    /// What of others loses blocks of its own when memory is short, so that leaks are not looked
    /// for; null for most.
    const char* leaking = nullptr;
};

/// Google Test says by it which row a case is of.
inline void PrintTo(const Row& row, std::ostream* out) {
    *out << row.name;
}

/// Runs `row` once without trouble; then in each kind of trouble, which comes at the first thing
/// that can go wrong, then at the second, and so on until the operation gets past all of them. Each
/// run must give back every block of memory. Counts what went wrong: see `FailureCount`.
void tryEachFailure(const Row& row);

/// How many failures all rows have met so far; printed when the program ends.
struct FailureCount {
    std::size_t rows = 0;
    std::size_t ofMemory = 0;
    std::size_t ofForeignCode = 0;
};

/// Runs `use` on another thread and waits for it: it hangs where a lock has been left behind. What
/// `use` allocates it must give back, since each thread counts its own blocks.
template <class Use>
void onAnotherThread(const Use& use) {
    pthread_t thread{};
    const auto run = [](void* given) -> void* {
        (*static_cast<const Use*>(given))();
        return nullptr;
    };
    ASSERT_EQ(::pthread_create(&thread, nullptr, run, const_cast<Use*>(&use)), 0);
    ::pthread_join(thread, nullptr);
}

/// A table of rows, each of them a case.
class FailingRows : public ::testing::TestWithParam<Row> {};

/// The name of a case.
inline const char* nameOfRow(const ::testing::TestParamInfo<Row>& info) {
    return info.param.name;
}

}  // namespace velkor::testing

/// Makes a test of each row of the array `rows`.
#define VELKOR_FAILING_ROWS(Suite, rows)               \
    using Suite = ::velkor::testing::FailingRows;      \
    TEST_P(Suite, KeepsItsPromises) {                  \
        ::velkor::testing::tryEachFailure(GetParam()); \
    }                                                  \
    INSTANTIATE_TEST_SUITE_P(Each, Suite, ::testing::ValuesIn(rows), ::velkor::testing::nameOfRow)
