#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/sources/InMemorySource.hpp"
#include "tests/configuration/changes/ChangeTesting.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::failureOf;
using testing::textOf;

class Unset : public ChangeTest {};

TEST_F(Unset, TakesTheKeyOutOfTheSourceThatSetWrites) {
    set("a", 1);
    EXPECT_TRUE(store->unset("a").get());
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(Unset, OfAKeyThatIsNotThereGivesFalse) {
    store->set("a", 1, "default").get();
    EXPECT_FALSE(store->unset("a").get());
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Unset, ByNameTakesTheKeyOutOfThatSource) {
    set("a", 1);
    store->set("a", 2, "default").get();
    EXPECT_TRUE(store->unset("a", "default").get());
    EXPECT_EQ(store->explain("a").get().size(), 1U);
}

TEST_F(Unset, OfAGroupedSourceTakesTheFullKey) {
    add("net", "net", -1, {{"port", 1}});
    EXPECT_TRUE(store->unset("net.port").get());
    EXPECT_FALSE(store->has("net.port").get());
}

TEST_F(Unset, TellsWatchersWhatIsEffectiveThen) {
    store->set("a", 2, "default").get();
    set("a", 1);
    const Watch watched = watch("a");
    store->unset("a");
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Unset, TellsWatchersNothingWhenNothingIsEffective) {
    set("a", 1);
    const Watch watched = watch("a");
    store->unset("a");
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
}

TEST_F(Unset, OfAMissingKeyTellsNobody) {
    store->set("a", 1, "default").get();
    const Watch watched = watch("a");
    const ChangeWatch followed = follow("");
    store->unset("a");
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
    EXPECT_TRUE(followed.texts().empty());
}

TEST_F(Unset, WithoutAWritableSourceFailsAsSetDoes) {
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_EQ(failureOf(store->unset("a")), "No writable configuration source for key: a");
}

TEST_F(Unset, InAnUnknownSourceFailsAsSetDoes) {
    EXPECT_EQ(failureOf(store->unset("a", "nobody")),
              "Source not found or not writable: a, nobody");
}

TEST_F(Unset, InASourceThatCannotForgetFails) {
    const testing::TemporaryFile file("a=1\n");
    store->addPropertyFileSource("file", "", -1, false, file.path()).get();
    EXPECT_EQ(failureOf(store->unset("a")), "Configuration source can't forget keys: a, file");
    EXPECT_EQ(failureOf(store->unset("a", "file")),
              "Configuration source can't forget keys: a, file");
    EXPECT_EQ(valueOf("a"), "string 1");
}

TEST_F(Unset, IsLoggedAsASetIs) {
    set("a", 1);
    const testing::LogCapture log("velkor::configuration", common::debug);
    store->unset("a");
    store->unset("a", "default");
    EXPECT_THAT(log.messages(), ElementsAre("unset: a", "unset: a@override", "updatePublishers: a",
                                            "unset: a, default", "unset: a@default"));
}

TEST_F(Unset, OfATableGivesTheRemovedValueAndCallsTheListener) {
    InMemorySource source({{"a", 1}});
    std::string told;
    source.setChangeListener([&](const std::string& key) { told += key; });
    EXPECT_EQ(textOf(source.unset("a").value()), "int 1");
    EXPECT_FALSE(source.unset("a"));
    EXPECT_EQ(told, "a");
    EXPECT_FALSE(source.has("a"));
}

TEST_F(Unset, DuringARegistrationIsTold) {
    store->set("a", 7, "default").get();
    const Watch watched = watch("a");
    watched.subscriber->whenNext = [this, done = false](const ConfigurationValue&) mutable {
        if (!std::exchange(done, true)) store->unset("a", "new");
    };
    add("new", "", -1, {{"a", 1}});
    EXPECT_THAT(watched.values(), ElementsAre("int 7", "int 1", "int 7"));
}

TEST_F(Unset, DuringTheSecondRegistrationOfASourceIsToldOnce) {
    store->set("a", 7, "default").get();
    const auto source = std::make_shared<InMemorySource>(ValueMap{{"a", 1}});
    store->addSource("first", "", -1, false, source).get();
    const Watch watched = watch("a");
    watched.subscriber->whenNext = [this, done = false](const ConfigurationValue&) mutable {
        if (!std::exchange(done, true)) store->unset("a", "second");
    };
    store->addSource("second", "", -2, false, source).get();
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 1", "int 7"));
}

}  // namespace
}  // namespace velkor::configuration
