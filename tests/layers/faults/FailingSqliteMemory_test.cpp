#include <gtest/gtest.h>

#include <chrono>
#include <cstddef>
#include <exception>
#include <optional>
#include <string>

#include "tests/layers/faults/ScriptedWrites.hpp"
#include "tests/layers/faults/SimulatedState.hpp"
#include "tests/layers/faults/SqliteMemory.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::layers {
namespace {

using testing::expectFileToHold;
using testing::ScriptedWrites;
using testing::Shortage;
using testing::SimulatedState;
using testing::SqliteAllocationFailure;
using testing::sqliteBlocksHeld;
using testing::StateModel;
using testing::valuesOf;

// Before SQLite is used first.
const bool isControlled = [] {
    testing::controlSqliteMemory();
    return true;
}();

class FailingSqliteMemory : public ::testing::TestWithParam<Shortage> {
protected:
    /// Runs `use(shorten)` again and again. From where it calls `shorten` on, the first, second,
    /// ... allocation of SQLite fails, until that needs no more of them.
    template <class Use>
    void failEachAllocation(Use use) {
        bool hasFailed = true;
        for (std::size_t successes = 0; hasFailed && !HasFailure(); ++successes) {
            SCOPED_TRACE("after " + std::to_string(successes));
            std::optional<SqliteAllocationFailure> failure;
            use([&] { failure.emplace(successes, GetParam()); });
            hasFailed = failure->hasHappened();
        }
    }

    SimulatedState state;
    StateModel model{SimulatedState::author};
};

TEST_P(FailingSqliteMemory, LosesNothingAcknowledgedWhileWriting) {
    std::shared_ptr<SqliteSource> source = state.open();
    failEachAllocation([&](auto shorten) {
        shorten();
        ScriptedWrites(*source, model).make(state.clock.now());
    });
    source.reset();
    source = state.open();
    expectFileToHold(*source, model);
    ScriptedWrites(*source, model).set("later", 1);
    expectFileToHold(*source, model);
}

TEST_P(FailingSqliteMemory, LeavesTheFileAsItIsAndGivesAllBackWhileOpening) {
    ScriptedWrites(*state.open(), model).make(state.clock.now());
    const std::ptrdiff_t held = sqliteBlocksHeld();
    failEachAllocation([&](auto shorten) {
        shorten();
        try {
            EXPECT_EQ(valuesOf(*state.open()), model.values());
        } catch (const std::exception&) {
            // It couldn't be opened.
        }
        EXPECT_EQ(sqliteBlocksHeld(), held);
    });
    expectFileToHold(*state.open(), model);
}

TEST_P(FailingSqliteMemory, TellsWhyTheHistoryCannotBeRead) {
    const auto source = state.open();
    ScriptedWrites(*source, model).make(state.clock.now());
    const auto whole = testing::historyOf(*source);
    failEachAllocation([&](auto shorten) {
        shorten();
        try {
            EXPECT_EQ(testing::historyOf(*source), whole);
        } catch (const std::exception& error) {
            EXPECT_NE(std::string(error.what()).find("out of memory"), std::string::npos);
        }
    });
    EXPECT_EQ(testing::historyOf(*source), whole);
}

TEST_P(FailingSqliteMemory, UnsetsWhatHasExpiredOnceThereIsMemory) {
    constexpr std::chrono::hours lifetime{1};
    failEachAllocation([&](auto shorten) {
        {
            const auto source = state.open();
            source->setFor("temporary", 1, lifetime);
            EXPECT_TRUE(source->committed().get());
        }
        state.clock.advance(2 * lifetime);
        shorten();
        try {
            state.open()->committed().get();
        } catch (const std::exception&) {
            // It couldn't be opened, or the disk has not got it.
        }
    });
    const auto source = state.open();
    EXPECT_TRUE(source->committed().get());
    EXPECT_FALSE(source->has("temporary"));
}

std::string nameOf(const ::testing::TestParamInfo<Shortage>& info) {
    return info.param == Shortage::once ? "Once" : "FromThenOn";
}

INSTANTIATE_TEST_SUITE_P(Shortages, FailingSqliteMemory,
                         ::testing::Values(Shortage::once, Shortage::lasting), nameOf);

}  // namespace
}  // namespace velkor::layers
