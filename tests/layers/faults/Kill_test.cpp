#include <gtest/gtest.h>

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "tests/layers/faults/KilledWriter.hpp"
#include "tests/layers/faults/WriterProcess.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::layers {
namespace {

namespace fs = std::filesystem;

using testing::below;
using testing::journalOf;
using testing::Random;
using testing::RandomWrites;
using testing::StateFolder;
using testing::StateModel;
using testing::valuesOf;
using testing::WriterProcess;

/// How many writers are killed: VELKOR_KILLS, or 1000 when that is not set.
std::uint64_t kills() {
    const char* const number = std::getenv("VELKOR_KILLS");
    return number == nullptr ? 1000 : std::stoull(number);
}

/// A file whose writer is killed again and again, and what it is to hold.
class KilledState {
public:
    /// Kills a writer, at any moment from its start on.
    void kill(std::uint64_t seed) {
        WriterProcess writer({VELKOR_KILLED_WRITER, folder.file().string(), std::to_string(seed)});
        Random moment(~seed);
        std::size_t acknowledged = model.size();
        for (std::size_t reports = below(15, moment); reports > 0; --reports) {
            acknowledged = writer.nextReport().value_or(acknowledged);
        }
        std::this_thread::sleep_for(std::chrono::microseconds(below(5000, moment)));
        EXPECT_TRUE(writer.kill());
        while (const auto report = writer.nextReport()) acknowledged = *report;
        look(seed, acknowledged);
    }

private:
    /// All that was acknowledged is there, and what follows it up to some write. Looks at a copy
    /// of the file, so that its log stays as the next writer is to find it.
    void look(std::uint64_t seed, std::size_t acknowledged) {
        const StateFolder copy;
        for (const char* const suffix : {"", "-wal"}) {
            const std::string name = folder.file().string() + suffix;
            if (fs::exists(name)) fs::copy_file(name, copy.file().string() + suffix);
        }
        const auto source = testing::openForKilledWriter(copy.file());
        const auto journal = journalOf(*source);
        EXPECT_GE(journal.size(), acknowledged);
        Random random(seed);
        RandomWrites writes(random, nullptr, model);
        while (model.size() < journal.size()) writes.writeSome({});
        model.keep(journal.size());
        EXPECT_EQ(journal, model.journal());
        EXPECT_EQ(valuesOf(*source), model.values());
    }

    StateFolder folder;
    StateModel model{testing::killedWriter};
};

TEST(Kill, LeavesEveryAcknowledgedWriteAndNothingByHalves) {
    std::optional<KilledState> state;
    const std::uint64_t count = kills();
    for (std::uint64_t seed = 0; seed < count && !HasFailure(); ++seed) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        if (seed % 25 == 0) state.emplace();
        state->kill(seed);
    }
}

}  // namespace
}  // namespace velkor::layers
