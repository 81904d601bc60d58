#include "host/console/PutCommand.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "host/console/Command.hpp"
#include "settings/Setting.hpp"
#include "tests/host/state/FakeState.hpp"
#include "tests/support/Thrown.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

class PutCommandTest : public ::testing::Test {
protected:
    PutCommandTest() { store->keepStateIn(state); }

    std::string put(const Words& arguments) { return putValue(store, arguments); }

    std::string refusal(const Words& arguments) {
        return thrownText<CommandError>([&] { put(arguments); });
    }

    std::string value(const std::string& key) {
        return velkor::testing::textOf(store->get(key).get());
    }

    std::shared_ptr<FakeState> state = std::make_shared<FakeState>();
    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{});
};

TEST_F(PutCommandTest, StoresAWordAsWhatItIsAsAWhole) {
    EXPECT_EQ(put({"a", "1e3"}), "");
    EXPECT_EQ(value("a"), "double 1000");
    EXPECT_EQ(store->getOption("a").get().source, "state");
}

TEST_F(PutCommandTest, StoresWhatIsQuotedAsText) {
    for (const char* typed : {"'5'", "\"5\"", "\\5", "''5"}) {
        put({"a", typed});
        EXPECT_EQ(value("a"), "string 5") << typed;
    }
}

TEST_F(PutCommandTest, StoresInTheSourceThatIsNamed) {
    put({"a", "1", "--source", "default"});
    EXPECT_EQ(store->getOption("a").get().source, "default");
}

TEST_F(PutCommandTest, StoresSeveralWordsAsAnArray) {
    put({"--type", "intArray", "a", "1", "'2'"});
    EXPECT_EQ(value("a"), "intArray [1, 2]");
    put({"a", "--type", "stringArray"});
    EXPECT_EQ(value("a"), "stringArray []");
}

TEST_F(PutCommandTest, RefusesAWordThatDoesNotFitTheType) {
    EXPECT_EQ(refusal({"a", "--type", "int", "2147483648"}),
              "--type int: not within -2147483648 to 2147483647");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(PutCommandTest, RefusesAnyOtherNumberOfValuesWithoutAType) {
    for (const Words& arguments : {Words{"a"}, Words{"a", "1", "2"}, Words{}}) {
        EXPECT_EQ(refusal(arguments), std::string("put takes ") + putUsage);
    }
}

TEST_F(PutCommandTest, TellsWhyAWriteIsRefused) {
    EXPECT_EQ(thrownText<std::runtime_error>([this] {
                  put({"a", "1", "--source", "no"});
              }),
              "Source not found or not writable: a, no");
    store->removeSource("state");
    store->removeSource("default");
    EXPECT_EQ(thrownText<std::runtime_error>([this] {
                  put({"a", "1"});
              }),
              "No writable configuration source for key: a");
}

TEST_F(PutCommandTest, LimitsAValueInTime) {
    EXPECT_EQ(put({"a", "1", "--for", "10m"}), "");
    EXPECT_EQ(state->calls, Words{"setFor a = 1 600000"});
    EXPECT_EQ(value("a"), "int 1");
}

TEST_F(PutCommandTest, TakesAnyTextForKeyAndValueInQuotesOrBehindTwoDashes) {
    put({"'--for'", "'--for'", "--for", "1h\\ 30min"});
    put({"--for", "1h", "--", "--type", "--for"});
    EXPECT_EQ(state->calls,
              (Words{"setFor --for = '--for' 5400000", "setFor --type = '--for' 3600000"}));
}

struct Lifetime {
    const char* test;
    std::string text;
    std::string refusal;

    friend std::ostream& operator<<(std::ostream& out, const Lifetime& it) {
        return out << it.text;
    }
};

class BadLifetimeTest : public PutCommandTest, public ::testing::WithParamInterface<Lifetime> {};

TEST_P(BadLifetimeTest, IsRefusedAndNothingWritten) {
    EXPECT_EQ(refusal({"a", "1", "--for", GetParam().text}), GetParam().refusal);
    EXPECT_EQ(state->calls, Words{});
    EXPECT_FALSE(store->has("a").get());
}

INSTANTIATE_TEST_SUITE_P(
    Lifetimes, BadLifetimeTest,
    ::testing::Values(Lifetime{"Zero", "0", "--for 0: not between 1ms and 36500d"},
                      Lifetime{"Negative", "-1s", "--for -1s: not between 1ms and 36500d"},
                      Lifetime{"TooLong", "36501d", "--for 36501d: not between 1ms and 36500d"}),
    [](const auto& tested) { return tested.param.test; });

TEST_F(PutCommandTest, RefusesATimeWithoutAUnit) {
    EXPECT_EQ(refusal({"a", "1", "--for", "10"}).rfind("--for 10: ", 0), 0U);
}

TEST_F(PutCommandTest, TakesTheLongestTime) {
    put({"a", "1", "--for", "36500d"});
    EXPECT_EQ(state->calls, Words{"setFor a = 1 3153600000000"});
}

TEST_F(PutCommandTest, RefusesATimeInALayerThatDoesNotLast) {
    EXPECT_EQ(refusal({"a", "1", "--for", "1s", "--source", "default"}),
              "--for stores in the layer that lasts, and not in default");
    put({"a", "1", "--for", "1s", "--source", "state"});
    EXPECT_EQ(state->calls, Words{"setFor a = 1 1000"});
}

TEST_F(PutCommandTest, SaysWhenNothingLasts) {
    store = std::make_shared<SessionStore>(SourceLimits{});
    EXPECT_EQ(refusal({"a", "1", "--for", "1s"}),
              "Nothing lasts in this session; start it with --state FILE for that.");
}

TEST_F(PutCommandTest, ADryRunShowsWhatWouldBe) {
    store->addInMemorySource("file", "", 1000, true, {{"a", std::string("8080")}});
    EXPECT_EQ(put({"a", "9090", "--dry-run"}),
              "LAYER      NOW            THEN\n"
              "state      -              9090\n"
              "effective  '8080' (file)  9090 (state)\n");
    EXPECT_EQ(value("a"), "string 8080");
}

TEST_F(PutCommandTest, ADryRunTellsOfALayerAboveThatDecides) {
    store->set("a", 2, "default");
    store->addInMemorySource("file", "", 1000, true, {{"a", std::string("8080")}});
    EXPECT_EQ(put({"a", "3", "--dry-run", "--source", "default"}),
              "LAYER      NOW            THEN\n"
              "default    2              3\n"
              "effective  '8080' (file)  '8080' (file)\n");
}

TEST_F(PutCommandTest, ADryRunOfANewKeyHasNothingToShowBefore) {
    EXPECT_EQ(put({"a", "1", "--for", "1s", "--dry-run"}),
              "LAYER      NOW  THEN\n"
              "state      -    1\n"
              "effective  -    1 (state)\n");
    EXPECT_EQ(state->calls, Words{});
}

TEST_F(PutCommandTest, ADryRunIsRefusedAsTheWriteWouldBe) {
    EXPECT_EQ(thrownText<std::runtime_error>([this] {
                  put({"a", "1", "--source", "no", "--dry-run"});
              }),
              "Changes refused: Source not found or not writable: a, no");
    EXPECT_EQ(refusal({"a", "x", "--type", "int", "--dry-run"}),
              "--type int: not a whole number in plain digits");
}

TEST_F(PutCommandTest, ADryRunShowsNoSecrets) {
    const settings::Setting<std::string> password(store, "password", "", settings::secret());
    store->set("password", "hidden");
    EXPECT_EQ(put({"password", "other", "--dry-run"}),
              "LAYER      NOW          THEN\n"
              "state      •••          •••\n"
              "effective  ••• (state)  ••• (state)\n");
}

TEST_F(PutCommandTest, EveryWriteIsToBeAcknowledged) {
    put({"a", "1"});
    store->acknowledge();
    put({"a", "1", "--for", "1s"});
    store->acknowledge();
    put({"a", "1", "--dry-run"});
    store->acknowledge();
    EXPECT_EQ(state->calls, (Words{"committed", "setFor a = 1 1000", "committed"}));
}

}  // namespace
}  // namespace velkor::host
