#include "host/console/StoreCommandRegistry.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "settings/Setting.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

class StoreCommandRegistryTest : public ::testing::Test {
protected:
    std::string run(const std::string& name, Words arguments) {
        return commands->find(name)->run(std::move(arguments));
    }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    std::shared_ptr<CommandRegistry> commands = std::make_shared<CommandRegistry>();
    Words remarks;
    std::shared_ptr<StoreCommandRegistry> registry = std::make_shared<StoreCommandRegistry>(
        store, commands, [this](std::string text) { remarks.push_back(std::move(text)); });
    configuration::ConfigurationCommandProvider provider{store, registry};
};

TEST_F(StoreCommandRegistryTest, NothingIsSaidOfWhatIsStoredAsItWasTyped) {
    for (const char* text : {"true", "5", "0.50", "text", "4294967296", ""}) {
        EXPECT_EQ(run("set", {"a", text}), "");
    }
    EXPECT_EQ(remarks, Words{});
}

TEST_F(StoreCommandRegistryTest, OneRemarkSaysWhatElseWasStored) {
    EXPECT_EQ(run("set", {"host", "10.20.0.9"}), "");
    EXPECT_EQ(run("set", {"wait", "20s"}), "");
    EXPECT_EQ(run("set", {"size", "1e3"}), "");
    EXPECT_EQ(remarks, (Words{"set host: 10.20.0.9 was stored as 10.2; put stores the whole word",
                              "set wait: 20s was stored as 20; put stores the whole word",
                              "set size: 1e3 was stored as 1; put stores the whole word"}));
}

TEST_F(StoreCommandRegistryTest, ARemarkSaysThatNothingWasStored) {
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_EQ(run("set", {"a", "1"}), "");
    EXPECT_EQ(remarks, Words{"set a: nothing was stored; put says why"});
}

TEST_F(StoreCommandRegistryTest, ARemarkShowsNoSecret) {
    const settings::Setting<std::string> pin(store, "pin", "", settings::secret());
    run("set", {"pin", "4711x"});
    EXPECT_EQ(remarks, Words{"set pin: ••• was stored as •••; put stores the whole word"});
}

TEST_F(StoreCommandRegistryTest, NamesTheArguments) {
    EXPECT_EQ(commands->find("set")->argumentText(), "KEY VALUE");
    EXPECT_EQ(commands->find("get")->argumentText(), "KEY");
}

TEST_F(StoreCommandRegistryTest, WithdrawsCommands) {
    EXPECT_TRUE(registry->unregisterCommand("velkor.configuration.set").get());
    EXPECT_EQ(commands->names().size(), 4U);
}

}  // namespace
}  // namespace velkor::host
