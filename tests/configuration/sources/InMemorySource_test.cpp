#include "configuration/sources/InMemorySource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::StrEq;
using testing::textOf;
using ::testing::ThrowsMessage;

static_assert(std::is_abstract_v<ConfigurationSource>);
static_assert(std::has_virtual_destructor_v<ConfigurationSource>);
static_assert(std::is_base_of_v<std::enable_shared_from_this<InMemorySource>, InMemorySource>);

class InMemorySourceTest : public ::testing::Test {
protected:
    static std::shared_ptr<InMemorySource> made(ValueMap values = {}) {
        return std::make_shared<InMemorySource>(std::move(values));
    }

    // A listener that notes the keys it is told.
    ChangeListener recorder() {
        return [this](const std::string& key) { told.push_back(key); };
    }

    std::vector<std::string> told;
};

TEST_F(InMemorySourceTest, TakesOverTheTable) {
    ValueMap values{{"a", 1}, {"b", std::string("x")}};
    InMemorySource source(std::move(values));
    EXPECT_TRUE(values.empty());  // NOLINT(bugprone-use-after-move): that is the promise
    EXPECT_EQ(textOf(source.get("a")), "int 1");
    EXPECT_EQ(textOf(source.get("b")), "string x");
}

TEST_F(InMemorySourceTest, SetOfANewKeyAnswersTheNewValue) {
    EXPECT_EQ(textOf(made()->set("a", 5)), "int 5");
}

TEST_F(InMemorySourceTest, SetOfANewKeyStoresTheValue) {
    const auto source = made();
    source->set("a", 5);
    EXPECT_EQ(textOf(source->get("a")), "int 5");
}

TEST_F(InMemorySourceTest, SetOfANewKeyTellsTheListener) {
    const auto source = made();
    source->setChangeListener(recorder());
    source->set("a", 5);
    EXPECT_THAT(told, ElementsAre("a"));
}

TEST_F(InMemorySourceTest, SecondSetAnswersTheReplacedValue) {
    const auto source = made();
    source->set("a", 5);
    EXPECT_EQ(textOf(source->set("a", true)), "int 5");
}

TEST_F(InMemorySourceTest, SecondSetStoresTheValueOfAnotherKind) {
    const auto source = made();
    source->set("a", 5);
    source->set("a", true);
    EXPECT_EQ(textOf(source->get("a")), "bool true");
}

TEST_F(InMemorySourceTest, SetOfAnInitialKeyAnswersTheInitialValue) {
    EXPECT_EQ(textOf(made({{"a", std::string("old")}})->set("a", 1)), "string old");
}

TEST_F(InMemorySourceTest, SetWithoutAListenerStoresTheValue) {
    const auto source = made();
    source->setChangeListener({});
    source->set("a", 5);
    EXPECT_EQ(textOf(source->get("a")), "int 5");
}

TEST_F(InMemorySourceTest, SetOfAnEqualValueTellsTheListenerAgain) {
    const auto source = made();
    source->setChangeListener(recorder());
    source->set("a", 5);
    source->set("a", 5);
    EXPECT_THAT(told, ElementsAre("a", "a"));
}

TEST_F(InMemorySourceTest, ListenerReadsTheNewValue) {
    const auto source = made({{"a", 1}});
    std::string seen;
    source->setChangeListener([&](const std::string& key) { seen = textOf(source->get(key)); });
    source->set("a", 2);
    EXPECT_EQ(seen, "int 2");
}

TEST_F(InMemorySourceTest, WhatTheListenerThrowsLeavesTheSetAndTheValueStored) {
    const auto source = made({{"a", 1}});
    source->setChangeListener([](const std::string&) { throw std::runtime_error("listener"); });
    EXPECT_THAT([&] { source->set("a", 2); }, ThrowsMessage<std::runtime_error>(StrEq("listener")));
    EXPECT_EQ(textOf(source->get("a")), "int 2");
}

TEST_F(InMemorySourceTest, ListenerMayWriteAnotherKey) {
    const auto source = made();
    source->setChangeListener([&](const std::string& key) {
        told.push_back(key);
        if (key.size() < 200) source->set(key + "x", 1);
    });
    source->set("x", 1);
    EXPECT_EQ(told.size(), 200U);
    EXPECT_EQ(source->keys().size(), 200U);
}

TEST_F(InMemorySourceTest, AnswerOfASetSurvivesWritesFromTheListener) {
    const auto source = made({{"a", std::string("first")}});
    bool nested = false;
    source->setChangeListener([&](const std::string&) {
        if (!std::exchange(nested, true)) source->set("a", std::string("nested"));
    });
    EXPECT_EQ(textOf(source->set("a", std::string("second"))), "string first");
    EXPECT_EQ(textOf(source->get("a")), "string nested");
}

TEST_F(InMemorySourceTest, SetTakesItsValueByValue) {
    const auto source = made();
    const ConfigurationValue value(std::string("kept"));
    source->set("a", value);
    EXPECT_EQ(textOf(value), "string kept");
}

TEST_F(InMemorySourceTest, NewListenerReplacesTheOldOne) {
    const auto source = made();
    bool oldCalled = false;
    source->setChangeListener([&](const std::string&) { oldCalled = true; });
    source->setChangeListener(recorder());
    source->set("a", 1);
    EXPECT_FALSE(oldCalled);
    EXPECT_THAT(told, ElementsAre("a"));
}

TEST_F(InMemorySourceTest, ReplacedListenerIsDestroyed) {
    const auto source = made();
    const auto token = std::make_shared<int>();
    source->setChangeListener([token](const std::string&) {});
    EXPECT_EQ(token.use_count(), 2);
    source->setChangeListener({});
    EXPECT_EQ(token.use_count(), 1);
}

TEST_F(InMemorySourceTest, EmptyListenerDetaches) {
    const auto source = made();
    source->setChangeListener(recorder());
    source->setChangeListener({});
    source->set("a", 1);
    EXPECT_THAT(told, IsEmpty());
}

TEST_F(InMemorySourceTest, GetOfAMissingKeyThrowsOutOfRange) {
    EXPECT_THAT([] { made()->get("a"); }, ThrowsMessage<std::out_of_range>(StrEq("_Map_base::at")));
}

TEST_F(InMemorySourceTest, HasIsFalseForAMissingKey) {
    EXPECT_FALSE(made({{"a", 1}})->has("b"));
}

TEST_F(InMemorySourceTest, AnyValueCountsForHas) {
    EXPECT_TRUE(made({{"a", ConfigurationValue()}})->has("a"));
}

TEST_F(InMemorySourceTest, GetAnswersACopy) {
    const auto source = made({{"a", std::vector<int>{1, 2}}});
    auto copy = source->get("a");
    boost::get<std::vector<int>>(copy).clear();
    EXPECT_EQ(textOf(source->get("a")), "intArray [1, 2]");
}

TEST_F(InMemorySourceTest, KeysOfAnEmptySourceAreEmpty) {
    EXPECT_THAT(made()->keys(), IsEmpty());
}

TEST_F(InMemorySourceTest, KeysAreSortedByByte) {
    const auto source = made({{"b", 1}, {"a.b", 1}, {"a", 1}, {"B", 1}, {"\xC3\xA4", 1}, {"", 1}});
    EXPECT_THAT(source->keys(), ElementsAre("", "B", "a", "a.b", "b", "\xC3\xA4"));
}

TEST_F(InMemorySourceTest, KeysIncludeWhatWasSet) {
    const auto source = made({{"b", 1}});
    source->set("a", 1);
    source->set("b", 2);
    EXPECT_THAT(source->keys(), ElementsAre("a", "b"));
}

TEST_F(InMemorySourceTest, EmptyStringIsAnOrdinaryKey) {
    const auto source = made();
    EXPECT_FALSE(source->has(""));
    source->setChangeListener(recorder());
    source->set("", 3);
    EXPECT_TRUE(source->has(""));
    EXPECT_EQ(textOf(source->get("")), "int 3");
    EXPECT_THAT(told, ElementsAre(""));
}

TEST_F(InMemorySourceTest, KeysAreComparedExactly) {
    const auto source = made({{"key", 1}});
    for (const std::string key : {"Key", "key ", "ke", "", "key."}) EXPECT_FALSE(source->has(key));
    EXPECT_FALSE(source->has(std::string("key\0", 4)));
}

TEST_F(InMemorySourceTest, KeysThatDifferBehindANulAreDifferent) {
    const auto source = made();
    source->set(std::string("k\0a", 3), 1);
    source->set(std::string("k\0b", 3), 2);
    EXPECT_EQ(textOf(source->get(std::string("k\0a", 3))), "int 1");
    EXPECT_EQ(textOf(source->get(std::string("k\0b", 3))), "int 2");
}

TEST_F(InMemorySourceTest, AlternatingLookUpsFindTheirOwnValues) {
    const auto source = made({{"a", 1}, {"b", 2}});
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(textOf(source->get("a")), "int 1");
        EXPECT_FALSE(source->has("c"));
        EXPECT_EQ(textOf(source->get("b")), "int 2");
    }
}

TEST_F(InMemorySourceTest, LookUpsSurviveTheGrowthOfTheTable) {
    const auto source = made({{"first", 1}});
    for (int number = 0; number < 10000; ++number) {
        source->set("key" + std::to_string(number), number);
        ASSERT_EQ(textOf(source->get("first")), "int 1");
    }
    EXPECT_EQ(textOf(source->get("key9999")), "int 9999");
}

TEST_F(InMemorySourceTest, GivesOutSharedPointersToItself) {
    const auto source = made();
    EXPECT_EQ(source->shared_from_this(), source);
}

}  // namespace
}  // namespace velkor::configuration
