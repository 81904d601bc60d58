#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::failureOf;
using ::testing::IsEmpty;
using ::testing::StrEq;
using testing::textOf;
using ::testing::ThrowsMessage;

using Writing = testing::StoreTest;

TEST_F(Writing, SetOfANewKeyAnswersTheNewValue) {
    EXPECT_EQ(textOf(store->set("a", 1).get()), "int 1");
}

TEST_F(Writing, SetOfAKnownKeyAnswersTheReplacedValue) {
    store->set("a", 1);
    EXPECT_EQ(textOf(store->set("a", 2).get()), "int 1");
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Writing, SetGoesToOverride) {
    store->set("a", 1);
    EXPECT_EQ(sourceOf("a"), "override");
}

TEST_F(Writing, SetGoesToOverrideEvenForAKeyOfDefault) {
    store->set("a", 1, "default");
    EXPECT_EQ(textOf(store->set("a", 2).get()), "int 2") << "the key is new to override";
    EXPECT_EQ(sourceOf("a"), "override");
    store->removeSource("override");
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Writing, SetByNameGoesToTheNamedSource) {
    EXPECT_EQ(textOf(store->set("a", 1, "default").get()), "int 1");
    EXPECT_EQ(sourceOf("a"), "default");
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Writing, SetByNameIsHiddenByAnEarlierSource) {
    store->set("a", 1);
    store->set("a", 2, "default");
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Writing, SetByNameAnswersWhatThatSourceHeld) {
    store->set("a", 1);
    store->set("a", 2, "default");
    EXPECT_EQ(textOf(store->set("a", 3, "default").get()), "int 2");
}

TEST_F(Writing, EarlierWritableSourceTakesWritesForKeysItDoesNotHold) {
    add("early", "", -5, {});
    store->set("a", 1);
    EXPECT_EQ(sourceOf("a"), "early");
}

TEST_F(Writing, ReadOnlySourceIsPassedOver) {
    add("early", "", -5, {{"a", 1}}, true);
    EXPECT_EQ(textOf(store->set("a", 2).get()), "int 2");
    EXPECT_EQ(valueOf("a"), "int 1") << "the read-only source still decides";
    store->removeSource("early");
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Writing, SourceOfAnotherGroupIsPassedOver) {
    const auto source = addHooked("early", "net", -5);
    store->set("network.port", 1);
    EXPECT_EQ(sourceOf("network.port"), "override");
    EXPECT_THAT(source->calls, IsEmpty());
}

TEST_F(Writing, SourceOfTheGroupGetsTheRelativeKey) {
    const auto source = addHooked("early", "net", -5);
    store->set("net.port", 80);
    EXPECT_EQ(source->calls.front(), "set port");
    EXPECT_EQ(valueOf("net.port"), "int 80");
}

TEST_F(Writing, TargetIsNotAskedWhetherItHasTheKey) {
    const auto source = addHooked("early", "", -5);
    source->whenSet = [&] { EXPECT_THAT(source->calls, ElementsAre("set a")); };
    store->set("a", 1);
    EXPECT_FALSE(source->calls.empty());
}

TEST_F(Writing, EmptyKeyIsWritten) {
    store->set("", 1);
    EXPECT_EQ(valueOf(""), "int 1");
}

TEST_F(Writing, AnyKindReplacesAnyOther) {
    store->set("a", 1);
    store->set("a", std::string("text"));
    EXPECT_EQ(valueOf("a"), "string text");
    store->set("a", std::vector<bool>{true, false});
    EXPECT_EQ(valueOf("a"), "boolArray [true, false]");
}

TEST_F(Writing, UnknownSourceNameFails) {
    auto answer = store->set("a", 1, "missing");
    EXPECT_THAT([&] { answer.get(); }, ThrowsMessage<std::runtime_error>(
                                           StrEq("Source not found or not writable: a, missing")));
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(Writing, NamedReadOnlySourceFails) {
    add("fixed", "", 5, {{"a", 1}}, true);
    EXPECT_EQ(failureOf(store->set("a", 2, "fixed")), "Source not found or not writable: a, fixed");
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Writing, NamedSourceOfAnotherGroupFails) {
    add("app", "app.", 5, {});
    EXPECT_EQ(failureOf(store->set("other.x", 1, "app")),
              "Source not found or not writable: other.x, app");
}

TEST_F(Writing, SourceNameIsComparedByteForByte) {
    EXPECT_EQ(failureOf(store->set("a", 1, "Override")),
              "Source not found or not writable: a, Override");
    EXPECT_EQ(failureOf(store->set("a", 1, "")), "Source not found or not writable: a, ");
}

TEST_F(Writing, StoreOfReadOnlySourcesRefusesEveryWrite) {
    store->removeSource("override");
    store->removeSource("default");
    add("fixed", "", 5, {{"a", 1}}, true);
    auto answer = store->set("a", 2);
    EXPECT_THAT([&] { answer.get(); }, ThrowsMessage<std::runtime_error>(
                                           StrEq("No writable configuration source for key: a")));
}

TEST_F(Writing, StoreOfOtherGroupsRefusesTheWrite) {
    store->removeSource("override");
    store->removeSource("default");
    add("app", "app", 5, {});
    EXPECT_EQ(failureOf(store->set("other", 1)), "No writable configuration source for key: other");
    EXPECT_EQ(failureOf(store->set("", 1)), "No writable configuration source for key: ");
}

TEST_F(Writing, ThrowFromSetLeavesTheCallAndFreesTheStore) {
    const auto source = addHooked("early", "", -5);
    source->whenSet = [] { throw std::logic_error("no room"); };
    EXPECT_THAT([&] { store->set("a", 1); }, ThrowsMessage<std::logic_error>(StrEq("no room")));
    EXPECT_THAT([&] { store->set("a", 1, "early"); },
                ThrowsMessage<std::logic_error>(StrEq("no room")));
    EXPECT_TRUE(testing::completes([store = store] { store->has("a"); }));
}

TEST_F(Writing, PropertyFileRegisteredAsWritableThrowsFromTheCall) {
    const testing::TemporaryFile file("a=1\n");
    store->addPropertyFileSource("file", "", -5, false, file.widePath());
    EXPECT_THAT(
        [&] { store->set("a", 1); },
        ThrowsMessage<std::runtime_error>(StrEq("PropertyFileSource does not support writing")));
    EXPECT_EQ(valueOf("a"), "string 1");
}

TEST_F(Writing, PropertyFileRegisteredAsReadOnlyIsPassedOver) {
    const testing::TemporaryFile file("a=1\n");
    store->addPropertyFileSource("file", "", 5, true, file.widePath());
    store->set("a", 2);
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Writing, ValueIsTheCallersOwnCopy) {
    const ConfigurationValue value(std::string("text"));
    store->set("a", value);
    EXPECT_EQ(textOf(value), "string text");
}

TEST_F(Writing, AnswerIsThereWhenTheCallReturns) {
    EXPECT_TRUE(testing::completes([store = store] {
        store->set("a", 1).get();
        store->set("a", 1, "default").get();
    }));
}

TEST_F(Writing, WriteReachesOneSourceOnly) {
    const auto first = addHooked("first", "", -5);
    const auto second = addHooked("second", "", -4);
    store->set("a", 1);
    EXPECT_EQ(first->values.size(), 1U);
    EXPECT_TRUE(second->values.empty());
}

}  // namespace
}  // namespace velkor::configuration
