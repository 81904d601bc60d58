#include <gmock/gmock.h>

#include <memory>
#include <string>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using WatchAddedSource = WatchTest;

TEST_F(WatchAddedSource, SourceThatWinsDeliversItsValue) {
    set("key", 1);
    const Watch started = watch("key");
    add("high", "", -1, {{"key", 2}});
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(WatchAddedSource, SourceThatLosesDeliversTheEffectiveValueAgain) {
    set("key", 1);
    const Watch started = watch("key");
    add("low", "", 5, {{"key", 2}});
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 1"));
}

TEST_F(WatchAddedSource, GroupIsPutInFrontOfTheKeys) {
    const Watch full = watch("net.port");
    const Watch relative = watch("port");
    add("net", "net", 5, {{"port", 80}});
    EXPECT_THAT(full.values(), ElementsAre("int 80"));
    EXPECT_THAT(relative.values(), IsEmpty());
}

TEST_F(WatchAddedSource, GroupWithADotIsNotGivenAnother) {
    const Watch started = watch("net.port");
    add("net", "net.", 5, {{"port", 80}});
    EXPECT_THAT(started.values(), ElementsAre("int 80"));
}

TEST_F(WatchAddedSource, WatchersOfItsKeysAreToldInTheOrderOfTheKeys) {
    std::vector<std::string> order;
    std::vector<Watch> watches;
    for (const std::string key : {"c", "a", "b"}) {
        watches.push_back(watch(key));
        watches.back().subscriber->whenNext = [&order, key](const auto&) { order.push_back(key); };
    }
    add("source", "", 5, {{"b", 1}, {"c", 1}, {"a", 1}});
    EXPECT_THAT(order, ElementsAre("a", "b", "c"));
}

TEST_F(WatchAddedSource, KeysThatItLacksAreNotSignalled) {
    set("other", 1);
    const Watch started = watch("other", 0);
    started.subscriber->request(velkor::testing::allValues);
    add("source", "", -1, {{"key", 2}});
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchAddedSource, RefusedNameDeliversNothing) {
    const Watch started = watch("key");
    EXPECT_FALSE(
        velkor::testing::failureOf(store->addInMemorySource("override", "", 5, false, {{"key", 1}}))
            .empty());
    EXPECT_THAT(started.values(), IsEmpty());
}

TEST_F(WatchAddedSource, WriteAfterTheAdditionIsDelivered) {
    add("net", "net", -1, {{"port", 80}});
    const Watch started = watch("net.port");
    set("net.port", 81);
    EXPECT_THAT(started.values(), ElementsAre("int 80", "int 81"));
}

using WatchRemovedSource = WatchTest;

TEST_F(WatchRemovedSource, ValueThatIsEffectiveNowIsDelivered) {
    set("key", 1);
    add("high", "", -1, {{"key", 2}});
    const Watch started = watch("key");
    EXPECT_TRUE(store->removeSource("high").get());
    EXPECT_THAT(started.values(), ElementsAre("int 2", "int 1"));
}

TEST_F(WatchRemovedSource, KeyThatVanishesIsNotSignalled) {
    add("only", "", 5, {{"key", 1}});
    const Watch started = watch("key");
    EXPECT_TRUE(store->removeSource("only").get());
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
    EXPECT_EQ(started.subscriber->completions, 0);
    EXPECT_THAT(started.subscriber->errors, IsEmpty());
}

TEST_F(WatchRemovedSource, KeyThatComesBackIsDeliveredAgain) {
    add("only", "", 5, {{"key", 1}});
    const Watch started = watch("key");
    EXPECT_TRUE(store->removeSource("only").get());
    add("again", "", 5, {{"key", 2}});
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(WatchRemovedSource, VanishedKeyKeepsItsUndeliveredValue) {
    add("only", "", 5, {{"key", 1}});
    const Watch started = watch("key", 0);
    EXPECT_TRUE(store->removeSource("only").get());
    started.subscriber->request(1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchRemovedSource, WatchersOfPrefixedKeysAreNotTold) {
    set("net.port", 1);
    add("net", "net", -1, {{"port", 80}});
    const Watch started = watch("net.port");
    EXPECT_TRUE(store->removeSource("net").get());
    EXPECT_EQ(valueOf("net.port"), "int 1");
    EXPECT_THAT(started.values(), ElementsAre("int 80"));
}

TEST_F(WatchRemovedSource, WatchersOfTheKeysWithoutTheGroupAreTold) {
    set("port", 1);
    add("net", "net", -1, {{"port", 80}});
    const Watch started = watch("port");
    EXPECT_TRUE(store->removeSource("net").get());
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 1"));
}

TEST_F(WatchRemovedSource, UnknownNameDeliversNothing) {
    set("key", 1);
    const Watch started = watch("key");
    EXPECT_FALSE(store->removeSource("missing").get());
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchRemovedSource, SourceThatIsWrittenAfterwardsReportsTheEffectiveValue) {
    set("key", 1);
    const auto source = addHooked("hooked", "", -1, {{"key", 2}});
    const Watch started = watch("key");
    EXPECT_TRUE(store->removeSource("hooked").get());
    source->set("key", 3);
    EXPECT_THAT(started.values(), ElementsAre("int 2", "int 1", "int 1"));
}

}  // namespace
}  // namespace velkor::configuration
