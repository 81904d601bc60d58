#include "host/console/StateCommands.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "host/console/Command.hpp"
#include "host/console/ValueText.hpp"
#include "settings/Setting.hpp"
#include "tests/host/state/FakeState.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

constexpr const char* nothingLasts =
    "Nothing lasts in this session; start it with --state FILE for that.";

class StateCommandsTest : public ::testing::Test {
protected:
    StateCommandsTest() { store->keepStateIn(state); }

    std::string value(const std::string& key) { return valueText(store->get(key).get()); }

    template <class Command>
    std::string refusal(Command command, const Words& arguments) {
        return thrownText<CommandError>([&] { command(store, arguments); });
    }

    std::shared_ptr<FakeState> state = std::make_shared<FakeState>();
    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
};

TEST_F(StateCommandsTest, UnsetShowsWhatIsEffectiveThen) {
    store->set("a", 1, "default");
    store->set("a", 2);
    EXPECT_EQ(unsetKey(store, {"a"}), "a = 1 (default)");
    EXPECT_EQ(value("a"), "1");
}

TEST_F(StateCommandsTest, UnsetSaysWhenTheKeyIsGone) {
    store->set("a", 2);
    EXPECT_EQ(unsetKey(store, {"a"}), "No configuration option with key: a");
}

TEST_F(StateCommandsTest, UnsetRefusesAKeyThatWasNotSet) {
    store->set("a", 1, "default");
    EXPECT_EQ(refusal(unsetKey, {"a"}), "Nothing to unset: a = 1 (default)");
    EXPECT_EQ(refusal(unsetKey, {"b"}), "Nothing to unset: No configuration option with key: b");
}

TEST_F(StateCommandsTest, UnsetTakesTheKeyOutOfTheSourceThatIsNamed) {
    store->set("a", 1, "default");
    store->set("a", 2);
    EXPECT_EQ(unsetKey(store, {"a", "--source", "default"}), "a = 2 (state)");
    EXPECT_EQ(unsetKey(store, {"a"}), "No configuration option with key: a");
}

TEST_F(StateCommandsTest, UnsetPassesOnWhatTheStoreRefuses) {
    store->addInMemorySource("fixed", "", 5, true, {{"a", 1}});
    EXPECT_EQ(thrownText<std::runtime_error>([this] {
                  unsetKey(store, {"a", "--source", "fixed"});
              }),
              "Source not found or not writable: a, fixed");
}

TEST_F(StateCommandsTest, UnsetTakesAKeyThatLooksLikeAnOptionInQuotes) {
    store->set("--source", 2);
    EXPECT_EQ(unsetKey(store, {"'--source'"}), "No configuration option with key: --source");
}

TEST_F(StateCommandsTest, HistoryIsATableInTheOrderOfTheLayer) {
    const std::chrono::system_clock::time_point when{std::chrono::seconds(1'700'000'000)};
    state->changes = {
        {12, when + std::chrono::milliseconds(1999), "ann", "unset", "server.port", 8, {}},
        {7, when, "bo", "set", "a", {}, std::string("x")}};
    EXPECT_EQ(showHistory(store, {}),
              "CHANGE  TIME                  WHO  KEY          ACTION  BEFORE  AFTER\n"
              "12      2023-11-14T22:13:21Z  ann  server.port  unset   8       -\n"
              "7       2023-11-14T22:13:20Z  bo   a            set     -       'x'\n");
}

struct HistoryCase {
    const char* test;
    Words arguments;
    std::string call;
};

class HistoryTest : public StateCommandsTest, public ::testing::WithParamInterface<HistoryCase> {};

TEST_P(HistoryTest, AsksForThis) {
    showHistory(store, GetParam().arguments);
    EXPECT_EQ(state->calls, Words{GetParam().call});
}

INSTANTIATE_TEST_SUITE_P(
    Histories, HistoryTest,
    ::testing::Values(HistoryCase{"Everything", {}, "history '' 20"},
                      HistoryCase{"AKey", {"a"}, "history 'a' 20"},
                      HistoryCase{"APrefix", {"server."}, "history 'server.' 20"},
                      HistoryCase{"AFew", {"--limit", "3"}, "history '' 3"},
                      HistoryCase{"AFewOfAKey", {"a", "--limit", "3"}, "history 'a' 3"},
                      HistoryCase{"AFewOfAKeyBehind", {"--limit", "3", "a"}, "history 'a' 3"},
                      HistoryCase{"AKeyLikeAnOption", {"'--limit'"}, "history '--limit' 20"}),
    [](const auto& tested) { return tested.param.test; });

TEST_F(StateCommandsTest, HistoryRefusesALimitThatIsNoCount) {
    for (const char* text : {"0", "-1", "x", "1x", "99999999999999999999"}) {
        EXPECT_EQ(refusal(showHistory, {"--limit", text}),
                  "--limit " + std::string(text) + ": a number from 1 on is needed");
    }
    EXPECT_EQ(refusal(showHistory, {"--limit", "''"}), "--limit : a number from 1 on is needed");
}

TEST_F(StateCommandsTest, HistoryRefusesASecondKeyAndOtherOptions) {
    EXPECT_EQ(refusal(showHistory, {"a", "b"}), "history takes [KEY] [--limit N]");
    EXPECT_EQ(refusal(showHistory, {"a", "--limit"}), "history: --limit needs N.");
    EXPECT_EQ(refusal(showHistory, {"--all"}),
              "history knows no option --all; quote it where it is an ordinary word.");
}

TEST_F(StateCommandsTest, UndoShowsTheChangeThatItMakes) {
    state->changes = {{8, {}, "ann", "undo", "a", 2, 1}};
    EXPECT_EQ(undoChange(store, {}),
              "CHANGE  TIME                  WHO  KEY  ACTION  BEFORE  AFTER\n"
              "8       1970-01-01T00:00:00Z  ann  a    undo    2       1\n");
    undoChange(store, {"7"});
    EXPECT_EQ(state->calls, (Words{"undo the newest", "undo 7"}));
}

TEST_F(StateCommandsTest, UndoRefusesWhatIsNoNumber) {
    EXPECT_EQ(refusal(undoChange, {"7x"}), "N is no number of a change: 7x");
}

TEST_F(StateCommandsTest, ShowNoSecrets) {
    const settings::Setting<std::string> password(store, "password", "", settings::secret());
    store->set("password", "hidden", "default");
    store->set("password", "hidden");
    EXPECT_EQ(unsetKey(store, {"password"}), "password = \u2022\u2022\u2022 (default)");
    state->changes = {{8, {}, "ann", "set", "password", {}, std::string("hidden")},
                      {7, {}, "ann", "set", "name", {}, std::string("shown")}};
    EXPECT_EQ(showHistory(store, {}),
              "CHANGE  TIME                  WHO  KEY       ACTION  BEFORE  AFTER\n"
              "8       1970-01-01T00:00:00Z  ann  password  set     -       \u2022\u2022\u2022\n"
              "7       1970-01-01T00:00:00Z  ann  name      set     -       'shown'\n");
}

TEST_F(StateCommandsTest, EveryWriteIsToBeAcknowledged) {
    state->changes = {{}};
    store->set("a", 1);
    store->acknowledge();
    unsetKey(store, {"a"});
    store->acknowledge();
    undoChange(store, {});
    store->acknowledge();
    EXPECT_EQ(state->calls, (Words{"committed", "committed", "undo the newest", "committed"}));
}

TEST(StateCommands, SayWhenNothingLasts) {
    const auto store = std::make_shared<SessionStore>(SourceLimits{});
    for (const auto& run : {showHistory, undoChange}) {
        EXPECT_EQ(thrownText<CommandError>([&] { run(store, {}); }), nothingLasts);
    }
}

TEST(StateCommands, WorkOnWhatDoesNotLast) {
    const auto store = std::make_shared<SessionStore>(SourceLimits{});
    store->set("a", 1);
    EXPECT_EQ(unsetKey(store, {"a"}), "No configuration option with key: a");
}

}  // namespace
}  // namespace velkor::host
