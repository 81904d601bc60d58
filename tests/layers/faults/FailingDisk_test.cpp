#include <gtest/gtest.h>

#include <chrono>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

#include "tests/layers/faults/ScriptedWrites.hpp"
#include "tests/layers/faults/SimulatedState.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::layers {
namespace {

using testing::DiskAnswer;
using testing::DiskFault;
using testing::DiskOperation;
using testing::expectFileToHold;
using testing::Random;
using testing::ScriptedWrites;
using testing::SimulatedState;
using testing::StateModel;

/// A way to fail.
struct Kind {
    const char* name;
    DiskOperation operation;
    DiskAnswer answer;
};

constexpr Kind kinds[]{
    {"Open", DiskOperation::open, DiskAnswer::failed},
    {"Read", DiskOperation::read, DiskAnswer::failed},
    {"Write", DiskOperation::write, DiskAnswer::failed},
    {"WriteOnAFullDisk", DiskOperation::write, DiskAnswer::full},
    {"ShortWrite", DiskOperation::write, DiskAnswer::partlyDone},
    {"Sync", DiskOperation::sync, DiskAnswer::failed},
    {"Resize", DiskOperation::resize, DiskAnswer::failed},
    {"Remove", DiskOperation::remove, DiskAnswer::failed},
};

enum class Duration { once, lasting };

/// How the writer ends. The fault is over by then, but where the writer closes the file.
enum class End { close, kill, powerCut };

class FailingDisk : public ::testing::TestWithParam<std::tuple<Kind, Duration, End>> {
protected:
    /// Lets the first, second, ... operation fail while a file is opened, written and closed, until
    /// there are no more of them, and looks what is left each time.
    void failEachOperation() {
        const auto [kind, duration, end] = GetParam();
        bool hasFailed = true;
        for (std::size_t successes = 0; hasFailed && !HasFailure(); ++successes) {
            SCOPED_TRACE("after " + std::to_string(successes));
            hasFailed = failOne(
                {kind.operation, kind.answer, successes, duration == Duration::lasting}, end);
        }
    }

private:
    static bool failOne(const DiskFault& fault, End end) {
        SimulatedState state;
        StateModel model(SimulatedState::author);
        ScriptedWrites(*state.open(), model).set("server.port", 0);
        state.disk().fail(fault);
        bool hasFailed = false;
        try {
            const auto source = state.open();
            ScriptedWrites(*source, model).make(state.clock.now());
            if (end != End::close) {
                hasFailed = state.disk().recover();
                state.disk().cutPowerAfter(0);
            }
        } catch (const std::runtime_error&) {
            // It couldn't be opened.
        }
        hasFailed = state.disk().recover() || hasFailed;
        Random random(fault.successes);
        if (end == End::powerCut) state.disk().restartAfterPowerCut(random);
        if (end == End::kill) state.disk().restartAfterKill();
        lookAndGoOn(state, model);
        return hasFailed;
    }

    /// What was acknowledged is there and nothing else, and the next write succeeds.
    static void lookAndGoOn(SimulatedState& state, StateModel& model) {
        state.clock.advance(std::chrono::hours(2));
        model.expire(state.clock.now());
        {
            const auto source = state.open();
            source->committed().get();
            expectFileToHold(*source, model);
            source->set("later", 1);
            model.set("later", 1);
            EXPECT_TRUE(source->committed().get());
        }
        expectFileToHold(*state.open(), model);
    }
};

/// All ways to fail, but that a disk which never syncs again loses its power: it may hold writes
/// then that it has refused.
std::vector<FailingDisk::ParamType> allWays() {
    std::vector<FailingDisk::ParamType> ways;
    for (const Kind& kind : kinds) {
        for (const Duration duration : {Duration::once, Duration::lasting}) {
            for (const End end : {End::close, End::kill, End::powerCut}) {
                const bool neverSyncs =
                    kind.operation == DiskOperation::sync && duration == Duration::lasting;
                if (neverSyncs && end == End::powerCut) continue;
                ways.emplace_back(kind, duration, end);
            }
        }
    }
    return ways;
}

std::string nameOf(const ::testing::TestParamInfo<FailingDisk::ParamType>& info) {
    const auto [kind, duration, end] = info.param;
    const std::string duringWhat = duration == Duration::once ? "Once" : "FromThenOn";
    const char* const ends[]{"ThenClosed", "ThenKilled", "ThenWithoutPower"};
    return kind.name + duringWhat + ends[static_cast<int>(end)];
}

TEST_P(FailingDisk, LosesNothingAcknowledgedAndKeepsNothingRefused) {
    failEachOperation();
}

INSTANTIATE_TEST_SUITE_P(Operations, FailingDisk, ::testing::ValuesIn(allWays()), nameOf);

}  // namespace
}  // namespace velkor::layers
