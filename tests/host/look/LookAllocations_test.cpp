#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <memory>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "host/console/Command.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/StoreCommandRegistry.hpp"
#include "host/look/LookCommands.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;
using velkor::testing::allocationsOfThisThread;
using velkor::testing::blocksHeldByThisThread;

// Tells what a command costs up to its first lines, and holds at its lines. JSON shows its first
// value by the third.
class MeasuredOutput final : public CommandOutput {
public:
    void line(std::string_view) override {
        if (++lines == 3) allocationsToFirstLines = allocationsOfThisThread() - allocationsBefore;
        mostBlocks = std::max(mostBlocks, blocksHeldByThisThread() - blocksBefore);
    }
    void note(std::string_view text) override { ADD_FAILURE() << text; }

    std::size_t lines = 0;
    std::size_t allocationsToFirstLines = 0;
    std::ptrdiff_t mostBlocks = 0;

private:
    const std::size_t allocationsBefore = allocationsOfThisThread();
    const std::ptrdiff_t blocksBefore = blocksHeldByThisThread();
};

struct LookCase {
    const char* name;
    const char* command;
    Words arguments{};

    friend std::ostream& operator<<(std::ostream& out, const LookCase& it) {
        return out << it.name;
    }
};

class LookAllocations : public ::testing::TestWithParam<LookCase> {
protected:
    static std::string manyProperties(std::size_t count) {
        constexpr std::size_t firstNumber = 1'000'000;  // all of them have as many digits
        std::string text;
        for (std::size_t i = 0; i < count; ++i) {
            text += "a.key.beyond.small.texts." + std::to_string(firstNumber + i) + "=1\n";
        }
        return text;
    }

    // Carries out the command on a store of so many keys.
    static MeasuredOutput measure(std::size_t keyCount) {
        const auto store = std::make_shared<SessionStore>(SourceLimits{});
        const auto registry = std::make_shared<CommandRegistry>();
        const configuration::ConfigurationCommandProvider storeCommands(
            store, std::make_shared<StoreCommandRegistry>(store, registry, [](const auto&) {}));
        const LookCommands lookCommands(store, registry);
        store->addSource("file", "", 1, true,
                         std::make_shared<configuration::PropertyFileSource>(
                             configuration::PropertyText{manyProperties(keyCount)}));
        MeasuredOutput output;
        registry->find(GetParam().command)->run(Words(GetParam().arguments), output);
        return output;
    }
};

TEST_P(LookAllocations, TheFirstLinesComeBeforeMostKeysAreKept) {
    const auto few = measure(1'000);
    const auto many = measure(100'000);
    EXPECT_GE(few.lines, 1'000U);
    EXPECT_GE(many.lines, 100'000U);
    EXPECT_EQ(few.allocationsToFirstLines, many.allocationsToFirstLines);
}

TEST_P(LookAllocations, MemoryIsThatOfSomeOfTheKeys) {
    EXPECT_LT(measure(250'000).mostBlocks, 70'000);
}

INSTANTIATE_TEST_SUITE_P(Commands, LookAllocations,
                         ::testing::Values(LookCase{"List", "list"}, LookCase{"Show", "show"},
                                           LookCase{"ShowJson", "show", {"--json"}},
                                           LookCase{"ShowAll", "show", {"--all"}},
                                           LookCase{"ShowRaw", "show", {"--raw"}},
                                           LookCase{"ShowPattern", "show", {"a.*"}},
                                           LookCase{"Diff", "diff"}, LookCase{"Export", "export"}),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace velkor::host
