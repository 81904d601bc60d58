#include "host/console/SettingsCommand.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "settings/Bound.hpp"
#include "settings/Setting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using namespace settings;
using Words = std::vector<std::string>;

struct Pool {
    int least = 0;
    int most = 0;
};

class SettingsCommandTest : public ::testing::Test {
protected:
    std::string run(Words arguments = {}) {
        return registry->find("settings")->run(std::move(arguments));
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
    std::optional<SettingsCommand> command{std::in_place, store, registry};
};

TEST_F(SettingsCommandTest, IsRegisteredWhileItsOwnerLives) {
    EXPECT_EQ(registry->names(), Words{"settings"});
    command.reset();
    EXPECT_EQ(registry->names(), Words{});
}

TEST_F(SettingsCommandTest, LeavesANameThatIsTakenToItsOwner) {
    const auto other = std::make_shared<CommandRegistry>();
    other->registerCommand({"settings", "", [](Words&&) { return "mine"; }, 0, 0});
    { const SettingsCommand shortLived(store, other); }
    EXPECT_EQ(other->find("settings")->run({}), "mine");
}

TEST_F(SettingsCommandTest, ShowsAllThatIsDeclared) {
    store->set("server.port", 9090);
    const Setting<std::string> token(store, "server.token", "none", secret(), needsRestart());
    const Setting<int> port(store, "server.port", 8080, between(1, 65535),
                            description("where it listens"));
    const Setting<std::optional<int>> limit(store, "limit", needsRestart());
    EXPECT_EQ(run(),
              "KEY           VALUE  SOURCE    DEFAULT  TYPE             CONSTRAINT           "
              "NOTES                  DESCRIPTION\n"
              "limit         -      -         -        int, or nothing  -                    "
              "needs restart\n"
              "server.port   9090   override  8080     int              between 1 and 65535  "
              "-                      where it listens\n"
              "server.token  •••    -         •••      text             -                    "
              "secret, needs restart\n");
}

TEST_F(SettingsCommandTest, ShowsADashWhereThereIsNoDefault) {
    store->set("name", "x");
    const Setting<std::string> name(store, "name");
    EXPECT_EQ(run(),
              "KEY   VALUE  SOURCE    DEFAULT  TYPE  CONSTRAINT  NOTES  DESCRIPTION\n"
              "name  x      override  -        text  -           -\n");
}

TEST_F(SettingsCommandTest, CutsLongValues) {
    const Setting<std::string> name(store, "name", std::string(61, 'd'));
    store->set("name", std::string(60, 'v'));
    const std::string row = run();
    EXPECT_NE(row.find(' ' + std::string(60, 'v') + ' '), std::string::npos);
    EXPECT_NE(row.find(' ' + std::string(60, 'd') + "... "), std::string::npos);
}

TEST_F(SettingsCommandTest, ShowsTheErrorOfAStructOnce) {
    const Bound<Pool> pool(
        store, "pool", fields(&Pool::least, "least", 2, &Pool::most, "most", 8),
        [](const Pool& all) { return all.least > all.most ? "least is above most" : ""; });
    store->set("pool.most", 1);
    EXPECT_EQ(run(),
              "KEY         VALUE  SOURCE  DEFAULT  TYPE  CONSTRAINT  NOTES  DESCRIPTION\n"
              "pool.least  2      -       2        int   -           -\n"
              "pool.most   8      -       8        int   -           -\n"
              "pool: least is above most\n");
}

TEST_F(SettingsCommandTest, HidesSecretsInErrors) {
    const Setting<int> pin(store, "pin", 1, secret());
    store->set("pin", "verysecret");
    const std::string text = run();
    EXPECT_EQ(text.find("verysecret"), std::string::npos);
    EXPECT_NE(text.find("\npin: ••• from source \"override\" is no int: "), std::string::npos);
}

TEST_F(SettingsCommandTest, ShowsOnlyKeysThatThePrefixBegins) {
    const Setting<int> first(store, "pool.least", 1);
    const Setting<int> second(store, "server.port", 1);
    store->set("server.port", "x");
    EXPECT_EQ(run({"pool"}),
              "KEY         VALUE  SOURCE  DEFAULT  TYPE  CONSTRAINT  NOTES  DESCRIPTION\n"
              "pool.least  1      -       1        int   -           -\n");
}

TEST_F(SettingsCommandTest, SaysWhenNothingIsDeclared) {
    EXPECT_EQ(run(), "No setting is declared.");
    const Setting<int> port(store, "port", 1);
    EXPECT_EQ(run({"prot"}), "No setting is declared whose key begins with: prot");
}

TEST_F(SettingsCommandTest, ShowsWhatNobodyDeclaredAndWhatMayBeMeant) {
    const Setting<int> port(store, "server.port", 1);
    store->set("server.port", 2);
    store->set("server.prot", 3);
    store->set("colour", 4);
    EXPECT_EQ(run({"--undeclared"}),
              "KEY          NEAR MISS OF\n"
              "colour       -\n"
              "server.prot  server.port\n");
    EXPECT_EQ(run({"--undeclared", "c"}),
              "KEY     NEAR MISS OF\n"
              "colour  -\n");
}

TEST_F(SettingsCommandTest, ShowsNothingWhereAllIsDeclared) {
    const Setting<int> port(store, "server.port", 1);
    store->set("server.port", 2);
    EXPECT_EQ(run({"--undeclared"}), "");
}

TEST_F(SettingsCommandTest, TakesOnePrefix) {
    for (const Words& arguments : {Words{"a", "b"}, Words{"a", "--undeclared"}}) {
        EXPECT_EQ(thrownText<CommandError>([&] { run(arguments); }),
                  "settings takes one KEY-PREFIX; given: " + arguments[0] + ' ' + arguments[1]);
    }
}

TEST_F(SettingsCommandTest, TellsItsArgumentsToHelp) {
    EXPECT_EQ(registry->find("settings")->argumentText(), "[--undeclared] [KEY-PREFIX]");
}

TEST_F(SettingsCommandTest, SuggestsDeclaredKeys) {
    const Setting<int> port(store, "server.port", 1);
    const Setting<int> again(store, "server.port", 1);
    const Setting<int> limit(store, "limit", 1);
    EXPECT_EQ(registry->find("settings")->suggestions()(),
              (Words{"--undeclared", "limit", "server.port"}));
}

}  // namespace
}  // namespace velkor::host
