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

TEST_F(StateCommandsTest, PutStoresWhatTheTextMeans) {
    EXPECT_EQ(putValue(store, {"a", "1.5"}), "");
    putValue(store, {"b", "text"});
    EXPECT_EQ(value("a"), "1.5");
    EXPECT_EQ(value("b"), "'text'");
    EXPECT_EQ(store->getOption("a").get().source, "state");
}

TEST_F(StateCommandsTest, PutTellsWhyAWriteIsRefused) {
    store->removeSource("state");
    store->removeSource("default");
    EXPECT_EQ(thrownText<std::runtime_error>([this] {
                  putValue(store, {"a", "1"});
              }),
              "No writable configuration source for key: a");
}

TEST_F(StateCommandsTest, PutLimitsAValueInTime) {
    EXPECT_EQ(putValue(store, {"a", "1", "--for", "10m"}), "");
    EXPECT_EQ(state->calls, Words{"setFor a = 1 600000"});
    EXPECT_EQ(value("a"), "1");
}

TEST_F(StateCommandsTest, PutTakesAnyTextForKeyAndValue) {
    putValue(store, {"--for", "--for", "--for", "1h 30min"});
    EXPECT_EQ(state->calls, Words{"setFor --for = '--for' 5400000"});
}

struct Lifetime {
    const char* test;
    std::string text;
    std::string refusal;

    friend std::ostream& operator<<(std::ostream& out, const Lifetime& it) {
        return out << it.text;
    }
};

class BadLifetimeTest : public StateCommandsTest, public ::testing::WithParamInterface<Lifetime> {};

TEST_P(BadLifetimeTest, IsRefusedAndNothingWritten) {
    EXPECT_EQ(refusal(putValue, {"a", "1", "--for", GetParam().text}), GetParam().refusal);
    EXPECT_EQ(state->calls, Words{});
    EXPECT_FALSE(store->has("a").get());
}

INSTANTIATE_TEST_SUITE_P(
    Lifetimes, BadLifetimeTest,
    ::testing::Values(Lifetime{"Zero", "0", "--for 0: not between 1ms and 36500d"},
                      Lifetime{"Negative", "-1s", "--for -1s: not between 1ms and 36500d"},
                      Lifetime{"TooLong", "36501d", "--for 36501d: not between 1ms and 36500d"}),
    [](const auto& tested) { return tested.param.test; });

TEST_F(StateCommandsTest, PutRefusesATimeWithoutAUnit) {
    EXPECT_EQ(refusal(putValue, {"a", "1", "--for", "10"}).rfind("--for 10: ", 0), 0U);
}

TEST_F(StateCommandsTest, PutTakesTheLongestTime) {
    putValue(store, {"a", "1", "--for", "36500d"});
    EXPECT_EQ(state->calls, Words{"setFor a = 1 3153600000000"});
}

TEST_F(StateCommandsTest, PutRefusesWhatIsNoTimeBehindTheValue) {
    for (const Words& arguments :
         {Words{"a", "1", "--for"}, Words{"a", "--for", "1s"}, Words{"a", "1", "2", "3"}}) {
        EXPECT_EQ(refusal(putValue, arguments), "What follows VALUE is no --for TIME.");
    }
}

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
                      HistoryCase{"AFewOfAKey", {"a", "--limit", "3"}, "history 'a' 3"}),
    [](const auto& tested) { return tested.param.test; });

TEST_F(StateCommandsTest, HistoryRefusesALimitThatIsNoCount) {
    for (const char* text : {"0", "-1", "x", "1x", "", "99999999999999999999"}) {
        EXPECT_EQ(refusal(showHistory, {"--limit", text}),
                  "--limit " + std::string(text) + ": a number from 1 on is needed");
    }
}

TEST_F(StateCommandsTest, HistoryRefusesWhatIsNoLimitBehindTheKey) {
    for (const Words& arguments : {Words{"a", "--limit"}, Words{"a", "b"}, Words{"a", "b", "c"}}) {
        EXPECT_EQ(refusal(showHistory, arguments), "What follows KEY is no --limit N.");
    }
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
    putValue(store, {"a", "1"});
    store->acknowledge();
    putValue(store, {"a", "1", "--for", "1s"});
    store->acknowledge();
    unsetKey(store, {"a"});
    store->acknowledge();
    undoChange(store, {});
    store->acknowledge();
    EXPECT_EQ(state->calls, (Words{"committed", "setFor a = 1 1000", "committed", "committed",
                                   "undo the newest", "committed"}));
}

TEST(StateCommands, SayWhenNothingLasts) {
    const auto store = std::make_shared<SessionStore>(SourceLimits{});
    for (const auto& run : {putValue, showHistory, undoChange}) {
        const Words arguments = run == putValue ? Words{"a", "1", "--for", "1s"} : Words{};
        EXPECT_EQ(thrownText<CommandError>([&] { run(store, arguments); }), nothingLasts);
    }
}

TEST(StateCommands, WorkOnWhatDoesNotLast) {
    const auto store = std::make_shared<SessionStore>(SourceLimits{});
    putValue(store, {"a", "1"});
    EXPECT_EQ(store->getOption("a").get().source, "override");
    EXPECT_EQ(unsetKey(store, {"a"}), "No configuration option with key: a");
}

}  // namespace
}  // namespace velkor::host
