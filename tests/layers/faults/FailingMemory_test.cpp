#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <exception>
#include <memory>
#include <new>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/layers/faults/StateModel.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/support/AllocationCounter.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers {
namespace {

using testing::AllocationFailure;
using testing::AllocationFailureElsewhere;
using testing::expectFileToHold;
using testing::HandClock;
using testing::Latch;
using testing::Shortage;
using testing::StateFolder;
using testing::StateModel;
using testing::textOf;
using testing::valuesOf;

constexpr const char* author = "somebody";
constexpr std::chrono::hours lifetime{1};

class FailingMemory : public ::testing::TestWithParam<Shortage> {
protected:
    std::shared_ptr<SqliteSource> open() {
        SqliteOptions options;
        options.author = author;
        options.clock = clock.function();
        return SqliteSource::open(folder.file(), options);
    }

    /// Runs `use` with the first, second, ... allocation of this thread failing, until it needs no
    /// more, and `done` each time that it got through.
    template <class Use, class Done>
    void failEachAllocation(Use use, Done done) {
        bool hasFailed = true;
        for (std::size_t successes = 0; hasFailed && !HasFailure(); ++successes) {
            SCOPED_TRACE("after " + std::to_string(successes));
            bool isDone = false;
            {
                const AllocationFailure failure(successes, GetParam());
                try {
                    use();
                    isDone = true;
                } catch (const std::exception&) {
                }
                hasFailed = failure.hasHappened();
            }
            if (isDone) done();
        }
    }

    StateFolder folder;
    HandClock clock;
    StateModel model{author};
};

TEST_P(FailingMemory, GivesAllOfTheHistoryOrNothing) {
    const auto source = open();
    source->set("key", 1);
    source->set("key", std::string(100, 'x'));
    source->committed().get();
    std::vector<JournalEntry> history;
    failEachAllocation([&] { history = source->history("", 10); },
                       [&] { EXPECT_EQ(history.size(), 2U); });
}

TEST_P(FailingMemory, OpensOrLeavesTheFileAsItIs) {
    {
        const auto source = open();
        source->set("key", 1);
        source->setFor("temporary", 1, lifetime);
        model.set("key", 1);
        model.set("temporary", 1, clock.now() + lifetime);
    }
    clock.advance(2 * lifetime);
    model.expire(clock.now());
    std::shared_ptr<SqliteSource> source;
    failEachAllocation([&] { source = open(); },
                       [&] {
                           source->committed().get();
                           EXPECT_EQ(textOf(source->get("key")), "int 1");
                           source.reset();
                       });
    expectFileToHold(*open(), model);
}

/// Of the thread of a source.
class FailingMemoryOfItsThread : public FailingMemory {
protected:
    ~FailingMemoryOfItsThread() override { source.reset(); }

    /// Runs `prepare` and `write(n)`, the n-th allocation of the thread failing from in between,
    /// until it needs no more of them. Expects that the source holds what is on the disk, all that
    /// was acknowledged among it.
    template <class Prepare, class Write>
    void expectTableAndFileToAgree(Prepare prepare, Write write) {
        bool hasFailed = true;
        for (int number = 0; hasFailed && !HasFailure(); ++number) {
            SCOPED_TRACE(number);
            prepare();
            hasFailed = failOne(number, write);
        }
        EXPECT_TRUE(source->committed().get());
        const auto values = valuesOf(*source);
        source.reset();
        source = open();
        EXPECT_EQ(valuesOf(*source), values);
        EXPECT_EQ(replayed(), values);
        source->set("later", 1);
        EXPECT_TRUE(source->committed().get());
    }

    std::shared_ptr<SqliteSource> source = open();

private:
    /// Says whether the allocation was reached.
    template <class Write>
    bool failOne(int number, Write write) {
        Latch answered;
        bool isAcknowledged = false;
        auto failure = std::make_unique<AllocationFailureElsewhere>(
            static_cast<std::size_t>(number), GetParam());
        write(number);
        const auto told = source->committed().then([&](Future<bool>&& answer) {
            isAcknowledged = succeeds(answer);
            answered.countDown();
            return true;
        });
        while (!failure->hasHappened() && !answered.isOpen()) std::this_thread::yield();
        const bool hasFailed = failure->hasHappened();
        failure.reset();
        EXPECT_TRUE(answered.wait());
        if (isAcknowledged) {
            EXPECT_EQ(valuesOf(*source), replayed());
        }
        return hasFailed;
    }

    static bool succeeds(Future<bool>& answer) {
        try {
            return answer.get();
        } catch (const std::exception&) {
            return false;
        }
    }

    /// The values that the journal leads to. Its entries agree with each other.
    testing::SpelledValues replayed() {
        testing::SpelledValues values;
        auto journal = source->history("", 10'000);
        std::reverse(journal.begin(), journal.end());
        for (const JournalEntry& entry : journal) {
            const auto present = values.find(entry.key);
            EXPECT_EQ(entry.before ? textOf(*entry.before) : "none",
                      present == values.end() ? "none" : present->second);
            if (entry.after) {
                values[entry.key] = textOf(*entry.after);
            } else {
                values.erase(entry.key);
            }
        }
        return values;
    }
};

TEST_P(FailingMemoryOfItsThread, SetsOrKeepsTheOldValue) {
    expectTableAndFileToAgree([] {},
                              [&](int number) {
                                  source->set("new" + std::to_string(number), number);
                                  source->set("old", std::string(100, 'x'));
                              });
}

TEST_P(FailingMemoryOfItsThread, UnsetsOrKeepsTheOldValue) {
    expectTableAndFileToAgree(
        [&] {
            source->set("key", 1);
            source->setFor("temporary", 1, lifetime);
            EXPECT_TRUE(source->committed().get());
        },
        [&](int number) {
            source->unset("key");
            source->unset("temporary");
            source->setFor("temporary", number, lifetime);
        });
}

TEST_P(FailingMemoryOfItsThread, BeginsWithoutMemory) {
    expectTableAndFileToAgree([&] { source.reset(); },
                              [&](int number) {
                                  source = open();
                                  source->set("key", number);
                              });
}

std::string nameOf(const ::testing::TestParamInfo<Shortage>& info) {
    return info.param == Shortage::once ? "Once" : "FromThenOn";
}

INSTANTIATE_TEST_SUITE_P(Shortages, FailingMemory,
                         ::testing::Values(Shortage::once, Shortage::lasting), nameOf);
INSTANTIATE_TEST_SUITE_P(Shortages, FailingMemoryOfItsThread,
                         ::testing::Values(Shortage::once, Shortage::lasting), nameOf);

}  // namespace
}  // namespace velkor::layers
