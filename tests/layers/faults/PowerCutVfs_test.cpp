#include "tests/layers/faults/PowerCutVfs.hpp"

#include <gtest/gtest.h>

#include <map>
#include <optional>
#include <stdexcept>
#include <string>

#include "tests/layers/faults/BareTable.hpp"

namespace velkor::testing {
namespace {

/// What a restart found.
enum class Found { everything, lessThanAcknowledged, damage };

/// Bare SQLite on a disk that loses power again and again.
class BareTableOverPowerCuts {
public:
    explicit BareTableOverPowerCuts(std::string level) : synchronous(std::move(level)) {}

    /// Writes until the power is cut, and looks what is left.
    Found cut(std::uint64_t seed) {
        Random random(seed);
        vfs.disk().cutPowerAfter(below(120, random));
        writeUntilCut(random);
        vfs.disk().restartAfterPowerCut(random);
        try {
            return look();
        } catch (const std::runtime_error&) {
            return Found::damage;
        }
    }

private:
    /// Each write has the number of writes before it.
    void writeUntilCut(Random& random) {
        try {
            BareTable table("bare.db", vfs.name(), synchronous);
            while (table.set("key" + std::to_string(below(5, random)), next)) {
                acknowledged = ++next;
            }
        } catch (const std::runtime_error&) {
            EXPECT_FALSE(vfs.disk().hasPower());
        }
    }

    Found look() {
        BareTable table("bare.db", vfs.name(), synchronous);
        if (table.numbers() != table.journalled()) return Found::damage;
        const int kept = static_cast<int>(table.writes());
        const bool isKept = kept >= acknowledged && kept <= acknowledged + 1;
        acknowledged = next = kept;
        return isKept ? Found::everything : Found::lessThanAcknowledged;
    }

    const std::string synchronous;
    PowerCutVfs vfs{"bare-power-cut"};
    int next = 0;
    int acknowledged = 0;
};

/// How often each was found. Begins afresh now and then, and where the file is damaged.
std::map<Found, int> foundAfterCuts(std::uint64_t cuts, const std::string& synchronous) {
    std::map<Found, int> found;
    std::optional<BareTableOverPowerCuts> table;
    for (std::uint64_t seed = 1; seed <= cuts; ++seed) {
        if (!table || seed % 50 == 0) table.emplace(synchronous);
        const Found now = table->cut(seed);
        ++found[now];
        if (now == Found::damage) table.reset();
    }
    return found;
}

TEST(PowerCutVfs, KeepsAllThatWasSynced) {
    EXPECT_EQ(foundAfterCuts(1500, "FULL")[Found::everything], 1500);
}

TEST(PowerCutVfs, LosesWritesThatWereAcknowledgedBeforeASync) {
    const auto found = foundAfterCuts(300, "NORMAL");
    EXPECT_GT(found.at(Found::lessThanAcknowledged), 150);
    EXPECT_EQ(found.count(Found::damage), 0U);
}

TEST(PowerCutVfs, DamagesWhatIsNeverSynced) {
    EXPECT_GT(foundAfterCuts(300, "OFF")[Found::damage], 20);
}

}  // namespace
}  // namespace velkor::testing
