#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>

#include <sqlite3.h>

#include "tests/layers/faults/RandomWrites.hpp"
#include "tests/layers/faults/SimulatedState.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::layers {
namespace {

using velkor::testing::below;
using velkor::testing::journalOf;
using velkor::testing::Random;
using velkor::testing::RandomWrites;
using velkor::testing::SimulatedState;
using velkor::testing::StateModel;
using velkor::testing::valuesOf;

/// Lets connections that are opened while it lives take their log into the database much more often
/// than usual, with all that belongs to it.
class FrequentCheckpoints {
public:
    FrequentCheckpoints() { sqlite3_auto_extension(beginning()); }
    ~FrequentCheckpoints() { sqlite3_cancel_auto_extension(beginning()); }

    FrequentCheckpoints(const FrequentCheckpoints&) = delete;
    FrequentCheckpoints& operator=(const FrequentCheckpoints&) = delete;

private:
    using Beginning = void (*)();

    // The limit is set with the first commit, since opening sets the usual one at its end.
    static int begin(sqlite3* connection, const char**, const sqlite3_api_routines*) {
        sqlite3_commit_hook(connection, limitLog, connection);
        return SQLITE_OK;
    }

    static int limitLog(void* connection) {
        return sqlite3_wal_autocheckpoint(static_cast<sqlite3*>(connection), 20);
    }

    /// What SQLite calls with the arguments above.
    static Beginning beginning() { return reinterpret_cast<Beginning>(begin); }
};

/// How a life of the writer ends.
enum class End { powerCut, kill };

/// A source whose writer dies again and again, and what its file is to hold by then.
class MortalSource {
public:
    /// One life, up to its end at any access to the disk. First looks at what the one before left.
    void live(std::uint64_t seed, End end) {
        Random random(seed);
        state.disk().cutPowerAfter(below(100, random));
        try {
            const auto source = state.open();
            look(*source);
            while (state.disk().hasPower() && below(30, random) > 0) writeGroup(*source, random);
        } catch (const std::runtime_error& error) {
            EXPECT_FALSE(state.disk().hasPower()) << error.what();
        }
        wasKilled = end == End::kill;
        if (wasKilled) {
            state.disk().restartAfterKill();
        } else {
            state.disk().restartAfterPowerCut(random);
        }
        if (below(3, random) == 0) state.clock.advance(2 * RandomWrites::lifetime);
    }

    /// Looks at what the last life left.
    void look() { look(*state.open()); }

private:
    /// All that was acknowledged is there, and what follows it up to some write, with what has
    /// expired meanwhile. The values are those that the journal leads to.
    void look(SqliteSource& source) {
        source.committed().get();
        const auto journal = journalOf(source);
        const auto values = valuesOf(source);
        for (std::size_t kept = model.size() + 1; kept-- > acknowledged;) {
            StateModel left = model;
            left.keep(kept);
            left.expire(state.clock.now());
            if (left.journal() != journal) continue;
            EXPECT_EQ(values, left.values());
            // What is left of a killed writer is on the disk for sure with the next write only.
            if (!wasKilled || left.size() > kept) acknowledged = left.size();
            model = left;
            return;
        }
        ADD_FAILURE() << "of " << model.size() << " writes, " << acknowledged
                      << " acknowledged, the journal holds " << ::testing::PrintToString(journal);
    }

    /// A few writes, then their acknowledgement. Now and then the first of them stands still at the
    /// disk until the others have been made, which are one batch then.
    void writeGroup(SqliteSource& source, Random& random) {
        RandomWrites writes(random, &source, model);
        if (below(2, random) == 0) {
            state.disk().hold();
            if (writes.write(state.clock.now())) state.disk().waitUntilHolding();
            for (std::size_t count = below(5, random); count > 0; --count) {
                writes.write(state.clock.now());
            }
        } else {
            writes.writeSome(state.clock.now());
        }
        state.disk().letGo();
        source.committed().get();
        acknowledged = model.size();
    }

    SimulatedState state;
    StateModel model{SimulatedState::author};
    std::size_t acknowledged = 0;
    bool wasKilled = false;
};

/// How often the power is cut: VELKOR_POWER_CUTS, or 1500 when that is not set.
std::uint64_t powerCuts() {
    const char* const number = std::getenv("VELKOR_POWER_CUTS");
    return number == nullptr ? 1500 : std::stoull(number);
}

constexpr std::uint64_t livesOfOneFile = 10;

/// Lives until `lives` have ended, `endOf(seed)` each. Begins with a new file now and then.
template <class EndOf>
void expectToSurvive(std::uint64_t lives, EndOf endOf) {
    std::optional<MortalSource> source;
    std::optional<FrequentCheckpoints> checkpoints;
    for (std::uint64_t seed = 0; seed < lives; ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        if (seed % livesOfOneFile == 0) {
            source.emplace();
            checkpoints.reset();
            if (seed / livesOfOneFile % 2 == 0) checkpoints.emplace();
        }
        source->live(seed, endOf(seed));
        if (seed % livesOfOneFile == livesOfOneFile - 1) source->look();
        if (::testing::Test::HasFailure()) return;
    }
}

TEST(PowerCut, LeavesEveryAcknowledgedWriteAndNothingByHalves) {
    expectToSurvive(powerCuts(), [](std::uint64_t) { return End::powerCut; });
}

TEST(PowerCut, LeavesWhatWasAcknowledgedAmidOtherDeathsOfTheWriter) {
    expectToSurvive(powerCuts() / 3,
                    [](std::uint64_t seed) { return seed % 4 == 0 ? End::powerCut : End::kill; });
}

}  // namespace
}  // namespace velkor::layers
