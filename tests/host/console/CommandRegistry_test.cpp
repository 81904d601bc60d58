#include "host/console/CommandRegistry.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using administration::CommandDescriptor;
using velkor::testing::thrownText;
using Words = std::vector<std::string>;

CommandDescriptor named(const std::string& name) {
    return {name, "", [name](Words&&) { return "ran " + name; }, 0, 255};
}

class CommandRegistryTest : public ::testing::Test {
protected:
    bool add(const std::string& name) { return registry.registerCommand(named(name)).get(); }

    Words fullNames() const {
        Words names;
        for (const auto& command : registry.commands()) names.push_back(command->name());
        return names;
    }

    std::string findError(const std::string& name) const {
        return thrownText<CommandError>([&] { registry.find(name); });
    }

    CommandRegistry registry;
};

TEST_F(CommandRegistryTest, KeepsCommandsInTheOrderOfTheirRegistration) {
    EXPECT_TRUE(add("b"));
    EXPECT_TRUE(add("a"));
    EXPECT_TRUE(add("c"));
    EXPECT_EQ(fullNames(), (Words{"b", "a", "c"}));
}

TEST_F(CommandRegistryTest, RefusesANameThatIsTaken) {
    add("a");
    EXPECT_FALSE(add("a"));
    EXPECT_EQ(fullNames(), Words{"a"});
}

TEST_F(CommandRegistryTest, RefusesACommandWithoutAName) {
    EXPECT_FALSE(add(""));
}

TEST_F(CommandRegistryTest, RefusesACommandWithoutAHandler) {
    EXPECT_FALSE(registry.registerCommand({"a", "", nullptr, 0, 0}).get());
    EXPECT_EQ(fullNames(), Words{});
}

TEST_F(CommandRegistryTest, RefusesContradictoryLimits) {
    CommandDescriptor command = named("a");
    command.minimumArguments = 2;
    command.maximumArguments = 1;
    EXPECT_FALSE(registry.registerCommand(command).get());
}

TEST_F(CommandRegistryTest, WithdrawsACommand) {
    add("a");
    EXPECT_TRUE(registry.unregisterCommand("a").get());
    EXPECT_EQ(fullNames(), Words{});
}

TEST_F(CommandRegistryTest, SaysWhenThereIsNothingToWithdraw) {
    add("x.a");
    EXPECT_FALSE(registry.unregisterCommand("a").get());
}

TEST_F(CommandRegistryTest, TakesANameAgainOnceItIsFree) {
    add("a");
    registry.unregisterCommand("a");
    EXPECT_TRUE(add("a"));
}

TEST_F(CommandRegistryTest, FindsACommandByItsFullName) {
    add("velkor.configuration.get");
    EXPECT_EQ(registry.find("velkor.configuration.get")->run({}), "ran velkor.configuration.get");
}

TEST_F(CommandRegistryTest, FindsACommandByItsLastWord) {
    add("velkor.configuration.get");
    EXPECT_EQ(registry.find("get")->run({}), "ran velkor.configuration.get");
}

TEST_F(CommandRegistryTest, PrefersTheFullName) {
    add("x.get");
    add("get");
    EXPECT_EQ(registry.find("get")->name(), "get");
}

TEST_F(CommandRegistryTest, NamesWhatAnAmbiguousNameMayMean) {
    add("x.get");
    add("y.get");
    EXPECT_EQ(findError("get"), "Ambiguous command: get (may be: x.get, y.get)");
}

TEST_F(CommandRegistryTest, NamesAnUnknownCommand) {
    EXPECT_EQ(findError("frobnicate"), "Unknown command: frobnicate");
}

TEST_F(CommandRegistryTest, OffersNamesSimilarToAnUnknownOne) {
    add("x.get");
    add("set");
    EXPECT_EQ(findError("gat"), "Unknown command: gat (did you mean: get?)");
    EXPECT_EQ(findError("bet"), "Unknown command: bet (did you mean: get, set?)");
    EXPECT_EQ(findError("x.gt"), "Unknown command: x.gt (did you mean: x.get?)");
}

TEST_F(CommandRegistryTest, ShortensTheNameOfAnUnknownCommand) {
    EXPECT_EQ(findError(std::string(1000, 'x')),
              "Unknown command: " + std::string(80, 'x') + "...");
}

TEST_F(CommandRegistryTest, ListsShortNamesBeforeLongerOnes) {
    add("x.set");
    add("quit");
    EXPECT_EQ(registry.names(), (Words{"set", "quit", "x.set"}));
}

TEST_F(CommandRegistryTest, ACommandMayWithdrawItselfWhileItRuns) {
    const auto owned = std::make_shared<std::string>("alive");
    registry.registerCommand({"a", "",
                              [this, owned](Words&&) {
                                  registry.unregisterCommand("a");
                                  return *owned;
                              },
                              0, 0});
    EXPECT_TRUE(
        velkor::testing::completes([this] { EXPECT_EQ(registry.find("a")->run({}), "alive"); }));
    EXPECT_EQ(owned.use_count(), 1);
}

TEST_F(CommandRegistryTest, NoLockIsHeldWhileAHandlerIsDestroyed) {
    struct Reenter {
        CommandRegistry* registry;
        ~Reenter() { registry->commands(); }
    };
    const auto withdraw = [this] {
        auto reenter = std::make_shared<Reenter>(Reenter{&registry});
        registry.registerCommand(
            {"a", "", [held = std::move(reenter)](Words&&) { return std::string(); }, 0, 0});
        registry.unregisterCommand("a");
    };
    EXPECT_TRUE(velkor::testing::completes(withdraw));
}

TEST_F(CommandRegistryTest, MayBeUsedByManyThreads) {
    constexpr unsigned threadCount = 4;
    constexpr unsigned rounds = 200;
    std::atomic<unsigned> ran{0};
    velkor::testing::Latch start(threadCount);
    const auto work = [&](const std::string& name) {
        if (!start.arriveAndWait()) return;
        for (unsigned round = 0; round < rounds; ++round) {
            registry.registerCommand(named(name)).get();
            if (registry.find(name)->run({}) == "ran " + name) ++ran;
            registry.unregisterCommand(name).get();
        }
    };
    std::vector<std::thread> threads;
    for (unsigned i = 0; i < threadCount; ++i) threads.emplace_back(work, std::to_string(i));
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(ran, threadCount * rounds);
    EXPECT_EQ(fullNames(), Words{});
}

}  // namespace
}  // namespace velkor::host
