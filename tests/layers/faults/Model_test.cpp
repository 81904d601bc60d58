#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "tests/layers/faults/RandomWrites.hpp"
#include "tests/layers/faults/SimulatedState.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::layers {
namespace {

using testing::below;
using testing::Random;
using testing::RandomWrites;
using testing::SimulatedState;
using testing::StateModel;
using testing::textsOf;
using testing::valuesOf;

/// A source that is written and opened again at random, beside a map and a list.
class ModelledSource {
public:
    /// The journal keeps `count` entries.
    ModelledSource(std::uint64_t seed, std::size_t count) : random(seed), keepCount(count) {}

    void doSomething() {
        RandomWrites(random, source.get(), model).writeSome(state.clock.now());
        EXPECT_EQ(valuesOf(*source), model.values());
        EXPECT_TRUE(source->committed().get());
        if (below(10, random) == 0) openAgain();
        compareHistory();
    }

private:
    void openAgain() {
        source.reset();
        if (below(2, random) == 0) state.clock.advance(2 * RandomWrites::lifetime);
        source = state.open(keepCount);
        model.expire(state.clock.now());
        EXPECT_EQ(valuesOf(*source), model.values());
        EXPECT_TRUE(source->committed().get());
    }

    void compareHistory() {
        static const std::vector<std::string> asked{"",    "a",    "server.",   "server.port",
                                                    "x.y", "x.y.", "not there", "not there."};
        const std::string& keyOrPrefix = asked[below(asked.size(), random)];
        const std::size_t limit = below(30, random);
        EXPECT_EQ(textsOf(source->history(keyOrPrefix, limit)),
                  model.history(keyOrPrefix, limit, keepCount))
            << keyOrPrefix << ", " << limit;
    }

    Random random;
    const std::size_t keepCount;
    SimulatedState state;
    StateModel model{SimulatedState::author};
    std::shared_ptr<SqliteSource> source = state.open(keepCount);
};

void expectToAgree(std::size_t keepCount) {
    for (std::uint64_t seed = 0; seed < 10 && !::testing::Test::HasFailure(); ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        ModelledSource source(seed, keepCount);
        for (int i = 0; i < 100; ++i) source.doSomething();
    }
}

TEST(ModelledSource, HoldsAndTellsWhatTheModelDoes) {
    expectToAgree(10'000);
}

TEST(ModelledSource, TellsTheLastChangesOnlyWhereItKeepsFew) {
    expectToAgree(12);
}

}  // namespace
}  // namespace velkor::layers
