#include "host/console/HostCommands.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "host/console/ValueText.hpp"
#include "settings/Setting.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

const Words hostNames{"sources", "load", "unload", "explain", "watch", "unwatch", "put", "unset",
                      "history", "undo", "send",   "help",    "?",     "quit",    "exit"};

class ToldSource final : public configuration::InMemorySource,
                         public configuration::MonitoredSource {
public:
    explicit ToldSource(configuration::SourceState&& state)
        : InMemorySource(configuration::ValueMap()), told(std::move(state)) {}

    configuration::SourceState state() const override { return told; }

private:
    const configuration::SourceState told;
};

class HostCommandsTest : public ::testing::Test {
protected:
    HostServices services() {
        const auto show = [this](const auto& key, const auto& value) {
            shown.push_back(optionText(key, value));
        };
        return {store, std::make_shared<Watches>(store, show), nullptr, [this] { quitting = true; },
                std::make_shared<SessionSources>(store, SourceLimits{})};
    }

    /// Adds a source that stands as `state` says, in front of those that are there.
    void addTold(const std::string& name, configuration::SourceState state) {
        store->addSource(name, "", 0, true, std::make_shared<ToldSource>(std::move(state))).get();
    }

    std::string run(const std::string& name, Words arguments = {}) {
        return registry->find(name)->run(std::move(arguments));
    }

    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
    Words shown;
    bool quitting = false;
    HostCommands commands{services(), registry};
};

TEST_F(HostCommandsTest, AreRegisteredInOrder) {
    EXPECT_EQ(registry->names(), hostNames);
}

TEST_F(HostCommandsTest, AreWithdrawnWithTheirOwner) {
    const auto other = std::make_shared<CommandRegistry>();
    { const HostCommands shortLived(services(), other); }
    EXPECT_EQ(other->names(), Words{});
}

class HostCommandNameTest : public HostCommandsTest,
                            public ::testing::WithParamInterface<std::string> {};

TEST_P(HostCommandNameTest, StaysWithTheCommandThatHasItAlready) {
    const auto other = std::make_shared<CommandRegistry>();
    other->registerCommand({GetParam(), "", [](Words&&) { return std::string("mine"); }, 0, 0});
    { const HostCommands shortLived(services(), other); }
    EXPECT_EQ(other->names(), Words{GetParam()});
    EXPECT_EQ(other->find(GetParam())->run({}), "mine");
}

TEST_P(HostCommandNameTest, StaysWithACommandThatGotItLater) {
    const auto other = std::make_shared<CommandRegistry>();
    {
        const HostCommands shortLived(services(), other);
        other->unregisterCommand(GetParam());
        other->registerCommand({GetParam(), "", [](Words&&) { return std::string("mine"); }, 0, 0});
    }
    EXPECT_EQ(other->names(), Words{GetParam()});
}

INSTANTIATE_TEST_SUITE_P(Names, HostCommandNameTest, ::testing::ValuesIn(hostNames));

TEST_F(HostCommandsTest, KeepNothingAliveThroughTheRegistry) {
    const std::weak_ptr<CommandRegistry> weak = [this] {
        const auto other = std::make_shared<CommandRegistry>();
        const HostCommands shortLived(services(), other);
        return std::weak_ptr<CommandRegistry>(other);
    }();
    EXPECT_TRUE(weak.expired());
}

TEST_F(HostCommandsTest, SourcesListsThemInOrderOfPrecedence) {
    store->addInMemorySource("site", "server", 5, true, {});
    EXPECT_EQ(run("sources"),
              "NAME      GROUP    ORDER       ACCESS\n"
              "override  -        0           writable\n"
              "site      server.  5           read-only\n"
              "default   -        2147483647  writable\n");
}

TEST_F(HostCommandsTest, SourcesShowsWhatIsTheMatterWithOne) {
    addTold("ill", {false, std::nullopt, std::nullopt, "not now"});
    EXPECT_EQ(run("sources"),
              "NAME      GROUP  ORDER       ACCESS     PROBLEM\n"
              "ill       -      0           read-only  not now\n"
              "override  -      0           writable\n"
              "default   -      2147483647  writable\n");
}

TEST_F(HostCommandsTest, SourcesShowsTheDetailsOfOneThatIsWell) {
    configuration::SourceState well;
    well.details = {{"endpoint", "http://a"}, {"revision", "7"}};
    addTold("well", well);
    EXPECT_EQ(run("sources"),
              "NAME      GROUP  ORDER       ACCESS     STATE\n"
              "well      -      0           read-only  endpoint http://a, revision 7\n"
              "override  -      0           writable\n"
              "default   -      2147483647  writable\n");
}

TEST_F(HostCommandsTest, SourcesShowsDetailsBesideWhatIsTheMatter) {
    configuration::SourceState well;
    well.details = {{"revision", "7"}};
    addTold("well", well);
    addTold("ill", {false, std::nullopt, std::nullopt, "not now"});
    EXPECT_EQ(run("sources"),
              "NAME      GROUP  ORDER       ACCESS     STATE       PROBLEM\n"
              "ill       -      0           read-only              not now\n"
              "well      -      0           read-only  revision 7\n"
              "override  -      0           writable\n"
              "default   -      2147483647  writable\n");
}

TEST_F(HostCommandsTest, SourcesShowsStatesAsJson) {
    store->removeSource("override").get();
    store->removeSource("default").get();
    const configuration::SourceState::Time time(std::chrono::seconds(1'000'000'000));
    addTold("well", {});
    addTold("ill", {false, time, time, "not now", {{"revision", "7"}}});
    EXPECT_EQ(run("sources", {"--json"}),
              R"({"sources":[{"group":"","name":"ill","order":0,)"
              R"("problem":"since 2001-09-09T01:46:40Z: not now","readOnly":true,"state":)"
              R"({"details":{"revision":"7"},"lastError":"not now",)"
              R"("since":"2001-09-09T01:46:40Z","updated":"2001-09-09T01:46:40Z","well":false}},)"
              R"({"group":"","name":"well","order":0,"readOnly":true,)"
              R"("state":{"details":{},"well":true}}]})");
}

TEST_F(HostCommandsTest, LoadAndUnloadAddAndRemoveASource) {
    const velkor::testing::TemporaryFile file("a=1\n");
    EXPECT_EQ(run("load", {file.path().string()}), "Loaded as file.");
    EXPECT_TRUE(store->has("a").get());
    EXPECT_EQ(run("unload", {"file"}), "");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(HostCommandsTest, ExplainShowsTheEffectiveValueFirst) {
    store->addInMemorySource("site", "server", 5, true, {{"port", std::string("80")}});
    store->set("server.port", 1);
    store->set("server.port", 0.5, "default");
    EXPECT_EQ(run("explain", {"server.port"}),
              "effective   override  1\n"
              "overridden  site      '80'\n"
              "overridden  default   0.5\n");
}

TEST_F(HostCommandsTest, ExplainSaysWhenNoSourceHoldsTheKey) {
    EXPECT_EQ(run("explain", {"a"}), "No configuration option with key: a");
}

TEST_F(HostCommandsTest, ExplainHidesWhatIsSecretInEverySource) {
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    store->set("pin", 4711);
    store->set("pin", "verysecret", "default");
    EXPECT_EQ(run("explain", {"pin"}),
              "effective   override  •••\n"
              "overridden  default   •••\n");
}

TEST_F(HostCommandsTest, ExplainShowsWhatIsNoSecretBesideSecrets) {
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    store->set("pine", 1);
    EXPECT_EQ(run("explain", {"pine"}), "effective  override  1\n");
}

TEST_F(HostCommandsTest, WatchShowsValuesUntilUnwatch) {
    store->set("a", 1);
    EXPECT_EQ(run("watch", {"a"}), "");
    store->set("a", 2);
    EXPECT_EQ(run("unwatch", {"a"}), "");
    store->set("a", 3);
    EXPECT_EQ(shown, (Words{"a = 1", "a = 2"}));
}

TEST_F(HostCommandsTest, WatchRefusesAKeyThatIsWatched) {
    run("watch", {"a"});
    EXPECT_EQ(thrownText<CommandError>([&] { run("watch", {"a"}); }), "Watched already: a");
}

TEST_F(HostCommandsTest, UnwatchRefusesAKeyThatIsNotWatched) {
    EXPECT_EQ(thrownText<CommandError>([&] { run("unwatch", {"a"}); }), "Not watched: a");
}

TEST_F(HostCommandsTest, PutAndUnsetWorkOnTheStore) {
    EXPECT_EQ(run("put", {"a", "1"}), "");
    EXPECT_EQ(run("unset", {"a"}), "No configuration option with key: a");
}

TEST_F(HostCommandsTest, HistoryAndUndoNeedALayerThatLasts) {
    EXPECT_THROW(run("history", {"a", "--limit", "5"}), CommandError);
    EXPECT_THROW(run("undo"), CommandError);
}

TEST_F(HostCommandsTest, UndoSuggestsNoKeys) {
    EXPECT_EQ(registry->find("undo")->suggestions()(), Words{});
}

TEST_F(HostCommandsTest, HelpListsAllCommandsOfTheRegistry) {
    const configuration::ConfigurationCommandProvider storeCommands(store, registry);
    const std::string help = run("help");
    EXPECT_NE(help.find("explain                    KEY [OPTIONS]             Show every source"),
              std::string::npos);
    EXPECT_NE(help.find("velkor.configuration.set   2 arguments               Set a configuration "
                        "value.\n"),
              std::string::npos);
}

TEST_F(HostCommandsTest, HelpShowsOptionsOfOneCommandOnly) {
    EXPECT_NE(run("help").find("unset    KEY [OPTIONS]"), std::string::npos);
    EXPECT_EQ(run("help", {"unset"}).rfind("unset (KEY [--source SOURCE])\n", 0), 0U);
}

TEST_F(HostCommandsTest, HelpDescribesOneCommand) {
    const configuration::ConfigurationCommandProvider storeCommands(store, registry);
    EXPECT_EQ(run("help", {"get"}),
              "velkor.configuration.get (1 argument)\n"
              "Short: get\n"
              "Get a specific configuration value.\n");
    EXPECT_EQ(run("help", {"watch"}),
              "watch (KEY [--json])\nShow the value of a key now and whenever it changes.\n");
}

TEST_F(HostCommandsTest, HelpRefusesAnUnknownCommand) {
    EXPECT_THROW(run("help", {"nope"}), CommandError);
}

TEST_F(HostCommandsTest, HelpSuggestsCommandNames) {
    EXPECT_EQ(registry->find("help")->suggestions()(), registry->names());
}

TEST_F(HostCommandsTest, QuitEndsTheSession) {
    EXPECT_EQ(run("quit"), "");
    EXPECT_TRUE(quitting);
}

TEST_F(HostCommandsTest, ExitAndTheQuestionMarkAreOtherNamesOfCommands) {
    EXPECT_EQ(run("?"), run("help"));
    EXPECT_EQ(run("exit"), "");
    EXPECT_TRUE(quitting);
}

}  // namespace
}  // namespace velkor::host
