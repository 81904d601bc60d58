#include "tests/failing/Failing.hpp"

#include <iostream>
#include <limits>

#include "tests/support/Sanitizers.hpp"

namespace velkor::testing {

namespace {

constexpr std::size_t never = std::numeric_limits<std::size_t>::max();

thread_local std::size_t successesLeft = never;
thread_local Shortage kindOfTrouble = Shortage::once;
thread_local bool hasStruck = false;

FailureCount& counted() {
    static FailureCount count;
    return count;
}

class Report final : public ::testing::Environment {
public:
    void TearDown() override {
        const FailureCount& count = counted();
        std::cout << count.rows << " operations, " << count.ofMemory << " failures of memory, "
                  << count.ofForeignCode << " of foreign code\n";
    }
};

[[maybe_unused]] const auto* const report = ::testing::AddGlobalTestEnvironment(new Report);

// Says whether the trouble came.
bool tryFailure(const Row& row, std::optional<Trouble> trouble, std::size_t successes) {
    const std::ptrdiff_t held = blocksHeldByThisThread();
    bool struck = false;
    {
        Trial trial(trouble, successes);
        row.run(trial);
        struck = trial.hasStruck();
        if (struck) ++(trial.isOfMemory() ? counted().ofMemory : counted().ofForeignCode);
    }
    // What is made once for all of the program is made in the run without trouble.
    if (trouble && row.leaking == nullptr && !::testing::Test::HasFailure()) {
        EXPECT_EQ(blocksHeldByThisThread(), held);
    }
    return struck;
}

}  // namespace

void foreignCall() {
    if (successesLeft == never) return;
    if (successesLeft > 0) {
        --successesLeft;
        return;
    }
    hasStruck = true;
    if (kindOfTrouble == Shortage::once) successesLeft = never;
    throw ForeignFailure();
}

ForeignTrouble::ForeignTrouble(std::size_t successes, Shortage kind) noexcept {
    successesLeft = successes;
    kindOfTrouble = kind;
    hasStruck = false;
}

ForeignTrouble::~ForeignTrouble() {
    successesLeft = never;
}

bool ForeignTrouble::hasHappened() const noexcept {
    return hasStruck;
}

void tryEachFailure(const Row& row) {
    ++counted().rows;
    tryFailure(row, std::nullopt, 0);
    static constexpr const char* names[] = {"memory, once", "memory, for good", "foreign, once",
                                            "foreign, for good"};
    for (const Trouble trouble : {Trouble::memoryOnce, Trouble::memoryForGood, Trouble::foreignOnce,
                                  Trouble::foreignForGood}) {
        const bool isOfMemory = Trial(trouble, 0).isOfMemory();
        if (isSanitized && isOfMemory && row.leaking != nullptr) continue;
        bool struck = true;
        for (std::size_t successes = 0; struck && !::testing::Test::HasFailure(); ++successes) {
            SCOPED_TRACE(names[static_cast<int>(trouble)] +
                         (" after " + std::to_string(successes)));
            struck = tryFailure(row, trouble, successes);
        }
    }
}

}  // namespace velkor::testing
