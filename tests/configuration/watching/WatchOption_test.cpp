#include <gmock/gmock.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::configuration {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

using WatchOption = WatchTest;

TEST_F(WatchOption, CurrentValueIsDeliveredToTheFirstRequest) {
    set("key", 1);
    const Watch started = watch("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, CurrentValueWaitsForARequest) {
    set("key", 1);
    const Watch started = watch("key", 0);
    EXPECT_THAT(started.values(), IsEmpty());
}

TEST_F(WatchOption, CurrentValueIsTheOneOfTheWatchsBeginning) {
    set("key", 1);
    const Watch started{store->watchOption("key")};
    started.subscribe(1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, CurrentValueIsReplacedByANewerOneUntilItIsRequested) {
    set("key", 1);
    const Watch started{store->watchOption("key")};
    set("key", 2);
    started.subscribe(velkor::testing::allValues);
    EXPECT_THAT(started.values(), ElementsAre("int 2"));
}

TEST_F(WatchOption, CurrentValueIsTheEffectiveOne) {
    add("low", "", 10, {{"key", 1}});
    add("high", "", -10, {{"key", 2}}, true);
    EXPECT_THAT(watch("key").values(), ElementsAre("int 2"));
}

TEST_F(WatchOption, CurrentValueOfAGroupedSourceIsFoundByItsFullKey) {
    add("net", "net", 5, {{"port", 80}});
    EXPECT_THAT(watch("net.port").values(), ElementsAre("int 80"));
}

TEST_F(WatchOption, UnknownKeyDeliversNothing) {
    EXPECT_THAT(watch("key").values(), IsEmpty());
}

TEST_F(WatchOption, UnknownKeyDeliversItsFirstValueOnceASourceProvidesIt) {
    const Watch started = watch("key");
    add("late", "", 5, {{"key", 1}});
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, UnknownKeyDeliversItsFirstValueOnceItIsWritten) {
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, EmptyKeyCanBeWatched) {
    const Watch started = watch("");
    set("", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, KeyWithANullByteIsWatchedWhole) {
    const Watch whole = watch(std::string("a\0b", 3));
    const Watch part = watch("a");
    set(std::string("a\0b", 3), 1);
    EXPECT_THAT(whole.values(), ElementsAre("int 1"));
    EXPECT_THAT(part.values(), IsEmpty());
}

TEST_F(WatchOption, EveryKindOfValueIsDelivered) {
    const Watch started = watch("key");
    const std::vector<ConfigurationValue> kinds{true,
                                                -1,
                                                2U,
                                                0.5,
                                                std::u16string(u"wide"),
                                                std::string("narrow"),
                                                std::vector<bool>{true, false},
                                                std::vector<int>{1, 2},
                                                std::vector<unsigned int>{3U},
                                                std::vector<double>{1.5},
                                                std::vector<std::string>{"a", "b"},
                                                std::vector<std::u16string>{u"c"}};
    ASSERT_EQ(kinds.size(), configuration::typeTags.size());
    for (const auto& value : kinds) store->set("key", value).get();
    EXPECT_TRUE(started.subscriber->values == kinds) << ::testing::PrintToString(started.values());
}

TEST_F(WatchOption, EachCallStartsAWatchOfItsOwn) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    EXPECT_NE(first.publisher, second.publisher);
    set("key", 1);
    EXPECT_THAT(first.values(), ElementsAre("int 1"));
    EXPECT_THAT(second.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, StreamServesOneSubscriber) {
    const Watch started = watch("key");
    EXPECT_THROW(started.publisher->subscribe(std::make_shared<Watch::Recorder>()),
                 std::invalid_argument);
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, StreamKeepsOneUndeliveredValue) {
    const Watch started = watch("key", 0);
    for (int value = 1; value <= 3; ++value) set("key", value);
    started.subscriber->request(velkor::testing::allValues);
    EXPECT_THAT(started.values(), ElementsAre("int 3"));
}

TEST_F(WatchOption, StreamIsOpenUntilItIsCancelledOrTheStoreGoes) {
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_EQ(started.subscriber->completions, 0);
    EXPECT_THAT(started.subscriber->errors, IsEmpty());
}

TEST_F(WatchOption, StreamsAreNumberedFromZeroInOrderOfCreation) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    const Watch third = watch("key");
    open->removeStream(1);
    set("key", 1);
    EXPECT_THAT(first.values(), ElementsAre("int 1"));
    EXPECT_THAT(second.values(), IsEmpty());
    EXPECT_THAT(third.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, StreamNumberIsNeverUsedAgain) {
    watch("key").subscriber->cancel();
    const Watch second = watch("key");
    open->removeStream(0);
    set("key", 1);
    EXPECT_THAT(second.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, UnknownStreamNumberIsIgnored) {
    const Watch started = watch("key");
    open->removeStream(17);
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchOption, StoreWithoutASharedOwnerRefuses) {
    ConfigurationImpl unowned;
    EXPECT_THROW(unowned.watchOption("key"), std::bad_weak_ptr);
}

TEST_F(WatchOption, StoreWithoutASharedOwnerStaysUsableAfterTheRefusal) {
    ConfigurationImpl unowned;
    EXPECT_THROW(unowned.watchOption("key"), std::bad_weak_ptr);
    EXPECT_EQ(velkor::testing::textOf(unowned.set("key", 1).get()), "int 1");
}

TEST_F(WatchOption, ExceptionOfASourceLeavesTheCall) {
    const auto source = addHooked("hooked", "", -1);
    source->whenHas = [] { throw std::runtime_error("source"); };
    EXPECT_THROW(store->watchOption("key"), std::runtime_error);
}

TEST_F(WatchOption, ExceptionOfASourceLeavesTheWatchInTheStore) {
    const auto source = addHooked("hooked", "", -1, {{"key", 1}});
    source->whenGet = [] { throw std::runtime_error("source"); };
    EXPECT_THROW(store->watchOption("key"), std::runtime_error);
    source->whenGet = nullptr;
    const velkor::testing::LogCapture log("velkor::configuration");
    source->set("key", 2);
    EXPECT_THAT(log.messages(), Contains("notifying watcher: key"));
}

}  // namespace
}  // namespace velkor::configuration
