#include <gmock/gmock.h>

#include <string>
#include <thread>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using WatchWrites = WatchTest;

TEST_F(WatchWrites, EveryWriteIsDelivered) {
    const Watch started = watch("key");
    for (int value = 1; value <= 3; ++value) set("key", value);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2", "int 3"));
}

TEST_F(WatchWrites, EqualValueIsDeliveredAgain) {
    const Watch started = watch("key");
    set("key", 1);
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 1"));
}

TEST_F(WatchWrites, EqualValueReplacesTheKeptOneWithoutDemand) {
    const Watch started = watch("key", 0);
    set("key", 1);
    set("key", 1);
    started.subscriber->request(velkor::testing::allValues);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchWrites, ValueIsDeliveredBeforeTheWriteReturns) {
    const Watch started = watch("key");
    const auto answer = store->set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchWrites, ValueIsDeliveredOnTheWritingThread) {
    std::thread::id delivering;
    const Watch started = watch("key");
    started.subscriber->whenNext = [&](const auto&) { delivering = std::this_thread::get_id(); };
    std::thread::id writing;
    std::thread([&] {
        writing = std::this_thread::get_id();
        set("key", 1);
    }).join();
    EXPECT_EQ(delivering, writing);
}

TEST_F(WatchWrites, EffectiveValueIsDeliveredAndNotTheWrittenOne) {
    add("high", "", -1, {{"key", 7}}, true);
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_EQ(sourceOf("key"), "high");
    EXPECT_THAT(started.values(), ElementsAre("int 7", "int 7"));
}

TEST_F(WatchWrites, WriteBehindTheEffectiveSourceDeliversTheEffectiveValueAgain) {
    set("key", 1);
    const Watch started = watch("key");
    store->set("key", 2, "default").get();
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 1"));
}

TEST_F(WatchWrites, WriteByNameIsDelivered) {
    const Watch started = watch("key");
    store->set("key", 2, "default").get();
    EXPECT_THAT(started.values(), ElementsAre("int 2"));
}

TEST_F(WatchWrites, WriteIntoAGroupedSourceIsDeliveredUnderTheFullKey) {
    add("net", "net", -1, {});
    const Watch full = watch("net.port");
    const Watch relative = watch("port");
    set("net.port", 80);
    EXPECT_THAT(full.values(), ElementsAre("int 80"));
    EXPECT_THAT(relative.values(), IsEmpty());
}

TEST_F(WatchWrites, RefusedWriteDeliversNothing) {
    const Watch started = watch("key");
    EXPECT_EQ(velkor::testing::failureOf(store->set("key", 1, "missing")),
              "Source not found or not writable: key, missing");
    EXPECT_THAT(started.values(), IsEmpty());
}

struct OtherKey {
    const char* name;
    const char* key;
};

class WatchOtherKeys : public WatchTest, public ::testing::WithParamInterface<OtherKey> {};

TEST_P(WatchOtherKeys, AreNotToldOfAWrite) {
    const Watch other = watch(GetParam().key);
    set("app.key", 1);
    EXPECT_THAT(other.values(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Near, WatchOtherKeys,
    ::testing::Values(OtherKey{"Prefix", "app."}, OtherKey{"Group", "app"},
                      OtherKey{"RelativeKey", "key"}, OtherKey{"Longer", "app.key2"},
                      OtherKey{"Shorter", "app.ke"}, OtherKey{"OtherCase", "App.key"},
                      OtherKey{"TrailingBlank", "app.key "}, OtherKey{"Empty", ""}),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(WatchWrites, WatchersAreToldInOrderOfCreation) {
    std::vector<int> order;
    std::vector<Watch> watches;
    for (int number = 0; number < 20; ++number) {
        watches.push_back(watch("key"));
        watches.back().subscriber->whenNext = [&order, number](const auto&) {
            order.push_back(number);
        };
    }
    set("key", 1);
    std::vector<int> created(20);
    for (int number = 0; number < 20; ++number)
        created.at(static_cast<std::size_t>(number)) = number;
    EXPECT_EQ(order, created);
}

TEST_F(WatchWrites, ClientThatDropsThePublisherGoesOnReceiving) {
    Watch started = watch("key");
    started.publisher.reset();
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchWrites, ChangeThatASourceMakesByItselfIsDelivered) {
    const auto source = addHooked("hooked", "net", -1, {{"port", 80}});
    const Watch started = watch("net.port");
    source->values["port"] = 81;
    source->listener("port");
    EXPECT_THAT(started.values(), ElementsAre("int 80", "int 81"));
}

TEST_F(WatchWrites, ChangeReportedForAKeyThatNobodyHasIsIgnored) {
    const auto source = addHooked("hooked", "", -1);
    const Watch started = watch("key");
    source->listener("key");
    EXPECT_THAT(started.values(), IsEmpty());
}

TEST_F(WatchWrites, ChangeReportedForAVanishedKeyIsIgnored) {
    const auto source = addHooked("hooked", "", -1, {{"key", 1}});
    const Watch started = watch("key");
    source->values.clear();
    source->listener("key");
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

}  // namespace
}  // namespace velkor::configuration
