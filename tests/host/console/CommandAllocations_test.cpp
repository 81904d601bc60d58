#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <new>
#include <optional>
#include <string>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/HostCommands.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::host {
namespace {

using velkor::testing::AllocationFailure;
using Words = std::vector<std::string>;

administration::CommandDescriptor named(const std::string& name) {
    return {name, "", [](Words&&) { return std::string(); }, 0, 0};
}

class CommandAllocations : public ::testing::Test {
protected:
    // Calls `callable` with its first allocation failing, then its second and so on, until it does
    // not reach the failure. After each failure `check` is called; the number of failures.
    template <class Callable, class Check>
    static std::size_t failEachAllocation(Callable callable, Check check) {
        for (std::size_t successes = 0;; ++successes) {
            try {
                const AllocationFailure failure(successes);
                callable();
                if (!failure.hasHappened()) return successes;
                ADD_FAILURE() << "allocation " << successes << " failed unnoticed";
            } catch (const std::bad_alloc&) {
                check();
            }
        }
    }

    HostServices services() {
        const auto show = [](const auto&, const auto&) {};
        return {store, std::make_shared<Watches>(store, show), nullptr, [] {}};
    }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
};

TEST_F(CommandAllocations, ARegistrationThatFailsLeavesNothingRegistered) {
    const auto failures =
        failEachAllocation([this] { registry->registerCommand(named("a command of some length")); },
                           [this] { ASSERT_EQ(registry->names(), Words{}); });
    EXPECT_GT(failures, 0U);
    EXPECT_EQ(registry->names(), Words{"a command of some length"});
}

TEST_F(CommandAllocations, AWithdrawalThatFailsLeavesTheCommandRegistered) {
    registry->registerCommand(named("a"));
    const auto failures = failEachAllocation([this] { registry->unregisterCommand("a"); },
                                             [this] { ASSERT_EQ(registry->names(), Words{"a"}); });
    EXPECT_GT(failures, 0U);
    EXPECT_EQ(registry->names(), Words{});
}

TEST_F(CommandAllocations, HostCommandsThatFailHalfWayLeaveNothingRegistered) {
    const HostServices given = services();
    std::optional<HostCommands> commands;
    const auto failures = failEachAllocation([&] { commands.emplace(given, registry); },
                                             [this] { ASSERT_EQ(registry->names(), Words{}); });
    EXPECT_GT(failures, 0U);
}

TEST_F(CommandAllocations, StoreCommandsThatFailHalfWayLeaveNothingRegistered) {
    std::optional<configuration::ConfigurationCommandProvider> commands;
    const auto failures = failEachAllocation([&] { commands.emplace(store, registry); },
                                             [this] { ASSERT_EQ(registry->names(), Words{}); });
    EXPECT_GT(failures, 0U);
}

}  // namespace
}  // namespace velkor::host
