// A lack of memory leaves table, journal and listener at one.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <memory>
#include <new>
#include <optional>
#include <string>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/layers/sqlite/TestDisk.hpp"
#include "tests/support/AllocationCounter.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {
namespace {

using namespace std::chrono_literals;
using ::testing::ElementsAre;

const std::string key = "a.key.that.is.longer.than.a.string.holds.in.itself";
const std::string longText(100, 'x');

struct Write {
    std::string name;
    std::function<void(SqliteSource&)> run;
};

void PrintTo(const Write& write, std::ostream* stream) {
    *stream << write.name;
}

class WriteWithoutMemory : public ::testing::TestWithParam<Write> {};

// What is told, what stands in the table and what in the journal after a write that may have
// failed.
TEST_P(WriteWithoutMemory, IsMadeOrNot) {
    for (const Shortage shortage : {Shortage::once, Shortage::lasting}) {
        bool ranOut = true;
        for (std::size_t successes = 0; ranOut; ++successes) {
            SCOPED_TRACE(successes);
            const StateFolder folder;
            const auto source = SqliteSource::open(folder.file());
            source->set(key, longText);
            source->set(key, longText + "2");
            source->committed().get();
            int told = 0;
            source->setChangeListener([&](const std::string&) { ++told; });
            bool made = true;
            {
                const AllocationFailure failure(successes, shortage);
                try {
                    GetParam().run(*source);
                } catch (const std::bad_alloc&) {
                    made = false;
                }
                ranOut = failure.hasHappened();
            }
            EXPECT_TRUE(source->committed().get());
            EXPECT_EQ(told, made ? 1 : 0);
            EXPECT_EQ(source->history("", 10).size(), made ? 3U : 2U);
            const auto last = source->history("", 1).at(0);
            const bool has = source->has(key);
            EXPECT_EQ(has, last.after.has_value());
            if (has) {
                EXPECT_EQ(textOf(source->get(key)), textOf(*last.after));
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    , WriteWithoutMemory,
    ::testing::Values(Write{"Set", [](SqliteSource& s) { s.set(key, longText + "3"); }},
                      Write{"Unset", [](SqliteSource& s) { s.unset(key); }},
                      Write{"SetFor", [](SqliteSource& s) { s.setFor(key, longText, 1h); }},
                      Write{"Undo", [](SqliteSource& s) { s.undo(); }}),
    [](const auto& write) { return write.param.name; });

TEST(CommittedWithoutMemory, CanBeAskedAgain) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    bool ranOut = true;
    for (std::size_t successes = 0; ranOut; ++successes) {
        source->set(key, longText);
        std::optional<Future<bool>> committed;
        {
            const AllocationFailure failure(successes);
            try {
                committed = source->committed();
            } catch (const std::bad_alloc&) {
            }
            ranOut = failure.hasHappened();
        }
        if (!committed) committed = source->committed();
        EXPECT_TRUE(committed->get());
    }
}

// The thread of the source runs out of memory from its n-th allocation on after a sync that fails.
TEST(RefusalWithoutMemory, LeavesTheOldValues) {
    for (std::size_t successes = 0; successes < 60; ++successes) {
        SCOPED_TRACE(successes);
        const StateFolder folder;
        TestDisk disk;
        SqliteOptions options;
        options.vfs = TestDisk::name();
        const auto source = SqliteSource::open(folder.file(), options);
        source->set(key, longText);
        source->set(key + "2", longText);
        source->committed().get();
        static thread_local std::optional<AllocationFailure> failure;
        Latch stopped;
        Latch released;
        disk.beforeSync([&] {
            stopped.countDown();
            EXPECT_TRUE(released.wait());
            failure.emplace(successes, Shortage::once);
            return SQLITE_IOERR_FSYNC;
        });
        source->set(key, longText + "2");
        ASSERT_TRUE(stopped.wait());
        source->unset(key + "2");
        source->set(key + "3", longText);
        auto committed = source->committed();
        released.countDown();
        EXPECT_ANY_THROW(committed.get());
        disk.beforeSync([] {
            failure.reset();
            return SQLITE_OK;
        });
        EXPECT_THAT(source->keys(), ElementsAre(key, key + "2"));
        EXPECT_EQ(textOf(source->get(key)), "string " + longText);
        source->set(key + "4", 1);
        EXPECT_TRUE(source->committed().get());
    }
}

}  // namespace
}  // namespace velkor::testing
