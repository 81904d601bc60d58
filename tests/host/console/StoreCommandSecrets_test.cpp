#include "host/console/StoreCommandRegistry.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "settings/Setting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using configuration::ConfigurationCommandProvider;
using settings::secret;
using settings::Setting;
using velkor::testing::thrownText;
using Words = std::vector<std::string>;

class StoreCommandSecretsTest : public ::testing::Test {
protected:
    std::string run(const std::string& name, Words arguments = {}) {
        return registry->find(name)->run(std::move(arguments));
    }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
    std::shared_ptr<StoreCommandRegistry> masking =
        std::make_shared<StoreCommandRegistry>(store, registry, [](const std::string&) {});
    std::optional<ConfigurationCommandProvider> commands{std::in_place, store, masking};
};

TEST_F(StoreCommandSecretsTest, GetShowsNoSecret) {
    const Setting<std::string> token(store, "token", "t", secret());
    store->set("token", "verysecret");
    EXPECT_EQ(run("get", {"token"}), "•••");
}

TEST_F(StoreCommandSecretsTest, GetSaysWhenASecretHasNoValueInTheStore) {
    const Setting<std::string> token(store, "token", "t", secret());
    EXPECT_EQ(run("get", {"token"}), "No configuration option with key: token");
}

TEST_F(StoreCommandSecretsTest, GetShowsWhatIsNoSecretAsEver) {
    const Setting<std::string> token(store, "token", "t", secret());
    const Setting<std::string> name(store, "token.name", "n");
    store->set("token.name", "visible");
    store->set("undeclared", "•••");
    EXPECT_EQ(run("get", {"token.name"}), "'visible'");
    EXPECT_EQ(run("get", {"undeclared"}), "'•••'");
    EXPECT_EQ(run("get", {"absent"}), "No configuration option with key: absent");
}

TEST_F(StoreCommandSecretsTest, GetShowsTheValueOnceNobodyDeclaresItSecret) {
    { const Setting<std::string> token(store, "token", "t", secret()); }
    store->set("token", "visible");
    EXPECT_EQ(run("get", {"token"}), "'visible'");
}

TEST_F(StoreCommandSecretsTest, ListHidesSecretsOnly) {
    const Setting<int> pin(store, "b.pin", 1, secret());
    const Setting<std::string> name(store, "c", "n");
    store->set("a", true);
    store->set("b.pin", 4711);
    store->set("b.pine", 4711);
    store->set("c", "visible\nas ever");
    EXPECT_EQ(run("list"), "a = true\nb.pin = •••\nb.pine = 4711\nc = 'visible\nas ever'\n");
}

TEST_F(StoreCommandSecretsTest, ListShowsAllWhereNothingIsSecret) {
    store->set("b", 0.1);
    store->set("a", "x");
    EXPECT_EQ(run("list"), "a = 'x'\nb = 0.1\n");
}

TEST_F(StoreCommandSecretsTest, ListTakesWhateverArgumentsTheCommandTakes) {
    const Setting<int> pin(store, "pin", 1, secret());
    store->set("pin", 4711);
    EXPECT_EQ(run("list", {"any", "thing"}), "pin = •••\n");
}

TEST_F(StoreCommandSecretsTest, SetStaysSilentAndWrites) {
    const Setting<std::string> token(store, "token", "t", secret());
    EXPECT_EQ(run("set", {"token", "new"}), "");
    EXPECT_EQ(token.get(), "new");
}

TEST_F(StoreCommandSecretsTest, KeepsNamesTextsAndLimitsOfCommands) {
    const auto plain = std::make_shared<CommandRegistry>();
    const ConfigurationCommandProvider unmasked(store, plain);
    ASSERT_EQ(registry->names(), plain->names());
    for (const auto& name : plain->names()) {
        EXPECT_EQ(registry->find(name)->description(), plain->find(name)->description());
        for (const Words& words : {Words{}, Words{"a", "b", "c"}}) {
            EXPECT_EQ(thrownText<CommandError>([&] { run(name, words); }),
                      thrownText<CommandError>([&] { plain->find(name)->run(Words(words)); }));
        }
    }
}

TEST_F(StoreCommandSecretsTest, WithdrawsCommands) {
    commands.reset();
    EXPECT_EQ(registry->names(), Words{});
}

TEST_F(StoreCommandSecretsTest, GivesTheAnswersOfTheRegistry) {
    EXPECT_FALSE(masking->registerCommand({"", "", nullptr, 0, 0}).get());
    EXPECT_TRUE(masking->registerCommand({"a", "", [](Words&&) { return ""; }, 0, 0}).get());
    EXPECT_TRUE(masking->unregisterCommand("a").get());
    EXPECT_FALSE(masking->unregisterCommand("a").get());
}

}  // namespace
}  // namespace velkor::host
