#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::failureOf;
using testing::HookedSource;
using ::testing::IsEmpty;
using ::testing::StrEq;
using ::testing::ThrowsMessage;

constexpr int largest = std::numeric_limits<int>::max();
constexpr int smallest = std::numeric_limits<int>::min();

class SourceRegistry : public testing::StoreTest {
protected:
    std::string groupOf(const std::string& name) const {
        for (const auto& source : store->describeSources().get()) {
            if (source.name == name) return source.group;
        }
        return "(no such source)";
    }
};

TEST_F(SourceRegistry, FreshStoreHoldsOverrideAndDefault) {
    const auto sources = store->describeSources().get();
    ASSERT_EQ(sources.size(), 2U);
    EXPECT_EQ(sources[0].name, "override");
    EXPECT_EQ(sources[0].group, "");
    EXPECT_EQ(sources[0].order, 0);
    EXPECT_FALSE(sources[0].readOnly);
    EXPECT_EQ(sources[1].name, "default");
    EXPECT_EQ(sources[1].group, "");
    EXPECT_EQ(sources[1].order, 2147483647);
    EXPECT_FALSE(sources[1].readOnly);
}

TEST_F(SourceRegistry, DescribesWhatWasAdded) {
    add("extra", "app", -3, {}, true);
    const auto sources = store->describeSources().get();
    EXPECT_EQ(sources[0].name, "extra");
    EXPECT_EQ(sources[0].group, "app.");
    EXPECT_EQ(sources[0].order, -3);
    EXPECT_TRUE(sources[0].readOnly);
}

/// Says how it stands, and for that looks at its store from another thread.
class ToldSource final : public InMemorySource, public MonitoredSource {
public:
    explicit ToldSource(std::weak_ptr<ConfigurationImpl> watched)
        : InMemorySource(ValueMap()), store(std::move(watched)) {}

    SourceState state() const override {
        std::thread([this] { store.lock()->has("key").get(); }).join();
        SourceState told;
        told.isWell = false;
        told.lastError = "away";
        return told;
    }

private:
    const std::weak_ptr<ConfigurationImpl> store;
};

TEST_F(SourceRegistry, DescribesHowASourceStandsWithoutTheLockOfTheStore) {
    store->addSource("told", "", -1, true, std::make_shared<ToldSource>(store)).get();
    const auto sources = store->describeSources().get();
    ASSERT_TRUE(sources[0].state.has_value());
    EXPECT_FALSE(sources[0].state->isWell);
    EXPECT_EQ(sources[0].state->lastError, "away");
}

TEST_F(SourceRegistry, DescribesNoStateOfASourceThatTellsNone) {
    EXPECT_FALSE(store->describeSources().get()[0].state.has_value());
}

TEST_F(SourceRegistry, OrderFiveStandsBetweenOverrideAndDefault) {
    add("five", "", 5, {});
    EXPECT_THAT(names(), ElementsAre("override", "five", "default"));
}

TEST_F(SourceRegistry, AmongEqualOrdersTheNewerStandsFirst) {
    add("older", "", 5, {});
    add("newer", "", 5, {});
    EXPECT_THAT(names(), ElementsAre("override", "newer", "older", "default"));
}

TEST_F(SourceRegistry, OrderZeroStandsBeforeOverride) {
    add("zero", "", 0, {});
    EXPECT_THAT(names(), ElementsAre("zero", "override", "default"));
}

TEST_F(SourceRegistry, NegativeOrderStandsFirst) {
    add("negative", "", -1, {});
    EXPECT_THAT(names(), ElementsAre("negative", "override", "default"));
}

TEST_F(SourceRegistry, LargestOrderStandsBeforeDefault) {
    add("largest", "", largest, {});
    EXPECT_THAT(names(), ElementsAre("override", "largest", "default"));
}

TEST_F(SourceRegistry, ExtremeOrdersAreComparedNotSubtracted) {
    add("smallest", "", smallest, {});
    add("largest", "", largest, {});
    add("next", "", smallest + 1, {});
    add("one", "", 1, {});
    EXPECT_THAT(names(), ElementsAre("smallest", "next", "override", "one", "largest", "default"));
}

TEST_F(SourceRegistry, ManySourcesAreSortedByOrder) {
    for (const int order : {7, 3, 9, 1, 5}) add(std::to_string(order), "", order, {});
    EXPECT_THAT(names(), ElementsAre("override", "1", "3", "5", "7", "9", "default"));
}

TEST_F(SourceRegistry, GroupGetsADot) {
    add("extra", "app", 5, {});
    EXPECT_EQ(groupOf("extra"), "app.");
}

TEST_F(SourceRegistry, GroupWithADotStays) {
    add("extra", "app.", 5, {});
    EXPECT_EQ(groupOf("extra"), "app.");
}

TEST_F(SourceRegistry, EmptyGroupStaysEmpty) {
    add("extra", "", 5, {});
    EXPECT_EQ(groupOf("extra"), "");
}

TEST_F(SourceRegistry, GroupOfTwoDotsStays) {
    add("extra", "app..", 5, {});
    EXPECT_EQ(groupOf("extra"), "app..");
}

TEST_F(SourceRegistry, GroupOfOneDotAppliesToKeysThatBeginWithIt) {
    add("extra", ".", 5, {{"a", 1}});
    EXPECT_EQ(groupOf("extra"), ".");
    EXPECT_EQ(valueOf(".a"), "int 1");
    EXPECT_FALSE(store->has("a").get());
    EXPECT_FALSE(store->has("x.a").get());
}

TEST_F(SourceRegistry, GroupWithInnerDotsIsOnePrefix) {
    add("extra", "a.b", 5, {{"c", 1}});
    EXPECT_EQ(valueOf("a.b.c"), "int 1");
    EXPECT_FALSE(store->has("a.c").get());
}

TEST_F(SourceRegistry, SecondSourceOfANameIsRefused) {
    auto answer = store->addInMemorySource("override", "", 5, false, {});
    EXPECT_THAT([&] { answer.get(); },
                ThrowsMessage<std::invalid_argument>(
                    StrEq("Source with the requested name already exists: override")));
}

TEST_F(SourceRegistry, RefusedSourceLeavesTheListUnchanged) {
    store->addInMemorySource("override", "app", -5, true, {{"a", 1}});
    EXPECT_THAT(names(), ElementsAre("override", "default"));
    EXPECT_EQ(groupOf("override"), "");
    EXPECT_FALSE(store->has("app.a").get());
}

TEST_F(SourceRegistry, RefusedSourceIsNotCalled) {
    const auto source = std::make_shared<HookedSource>();
    EXPECT_EQ(failureOf(store->addSource("default", "", 5, false, source)),
              "Source with the requested name already exists: default");
    EXPECT_THAT(source->calls, IsEmpty());
    EXPECT_EQ(source.use_count(), 1);
}

TEST_F(SourceRegistry, NamesAreComparedByteForByte) {
    add("Override", "", 5, {});
    add("override ", "", 6, {});
    add(std::string("override\0", 9), "", 7, {});
    add("", "", 8, {});
    EXPECT_EQ(names().size(), 6U);
    EXPECT_EQ(failureOf(store->addInMemorySource("", "", 5, false, {})),
              "Source with the requested name already exists: ");
}

TEST_F(SourceRegistry, NullSourceIsRefused) {
    EXPECT_THAT(
        [&] { store->addSource("extra", "", 5, false, nullptr); },
        ThrowsMessage<std::invalid_argument>(StrEq("A configuration source must not be null.")));
    EXPECT_THAT(names(), ElementsAre("override", "default"));
}

TEST_F(SourceRegistry, NullSourceIsRefusedBeforeItsNameIsLookedAt) {
    EXPECT_THAT(
        [&] { store->addSource("override", "", 5, false, nullptr); },
        ThrowsMessage<std::invalid_argument>(StrEq("A configuration source must not be null.")));
}

TEST_F(SourceRegistry, AddedSourceIsAskedForKeysAndThenAttached) {
    const auto source = std::make_shared<HookedSource>();
    EXPECT_TRUE(store->addSource("extra", "app", 5, false, source).get());
    EXPECT_THAT(source->calls, ElementsAre("keys", "attach"));
}

TEST_F(SourceRegistry, StoreSharesAnAddedSource) {
    const auto source = std::make_shared<HookedSource>();
    store->addSource("extra", "", 5, false, source);
    EXPECT_GT(source.use_count(), 1);
}

TEST_F(SourceRegistry, SameSourceMayStandUnderTwoNames) {
    const auto source = addHooked("one", "a", 5, {{"k", 1}});
    EXPECT_TRUE(store->addSource("two", "b", 6, false, source).get());
    EXPECT_EQ(valueOf("a.k"), "int 1");
    EXPECT_EQ(valueOf("b.k"), "int 1");
}

TEST_F(SourceRegistry, ThrowFromKeysLeavesTheSourceRegisteredWithoutAListener) {
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"a", 1}});
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THAT([&] { store->addSource("extra", "", 5, false, source); },
                ThrowsMessage<std::logic_error>(StrEq("no keys")));
    EXPECT_THAT(names(), ElementsAre("override", "extra", "default"));
    EXPECT_FALSE(source->listener);
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(SourceRegistry, InMemorySourceTakesOverTheTable) {
    ValueMap values{{"a", 1}};
    store->addInMemorySource("extra", "", 5, false, std::move(values));
    EXPECT_TRUE(values.empty());  // NOLINT(bugprone-use-after-move): that is the promise
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(SourceRegistry, EnvironmentSourceAddsNothing) {
    EXPECT_FALSE(store->addEnvironmentSource("environment", "", 5).get());
    EXPECT_FALSE(store->addEnvironmentSource("override", "app", smallest).get());
    EXPECT_FALSE(store->addEnvironmentSource("", "", 0).get());
    EXPECT_THAT(names(), ElementsAre("override", "default"));
}

TEST_F(SourceRegistry, EnvironmentSourceReadsNothing) {
    store->addEnvironmentSource("environment", "", 5);
    EXPECT_THAT(store->keys().get(), IsEmpty());
}

TEST_F(SourceRegistry, PropertyFileIsRead) {
    const testing::TemporaryFile file("a=1\nb=2\n");
    EXPECT_TRUE(store->addPropertyFileSource("file", "app", 5, true, file.widePath()).get());
    EXPECT_EQ(valueOf("app.a"), "string 1");
    EXPECT_THAT(store->keys().get(), ElementsAre("app.a", "app.b"));
    EXPECT_THAT(names(), ElementsAre("override", "file", "default"));
}

TEST_F(SourceRegistry, MissingPropertyFileThrowsFromTheCall) {
    EXPECT_THAT(
        [&] { store->addPropertyFileSource("file", "", 5, true, u"/missing/\u00E9.properties"); },
        ThrowsMessage<std::runtime_error>(
            StrEq("Property file could not be opened: /missing/\xC3\xA9.properties")));
    EXPECT_THAT(names(), ElementsAre("override", "default"));
}

TEST_F(SourceRegistry, MissingPropertyFileIsNoticedBeforeATakenName) {
    EXPECT_THAT(
        [&] { store->addPropertyFileSource("override", "", 5, true, u"/missing/x"); },
        ThrowsMessage<std::runtime_error>(StrEq("Property file could not be opened: /missing/x")));
}

TEST_F(SourceRegistry, PropertyFileUnderATakenNameIsRefused) {
    const testing::TemporaryFile file("a=1\n");
    EXPECT_EQ(failureOf(store->addPropertyFileSource("override", "", 5, true, file.widePath())),
              "Source with the requested name already exists: override");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(SourceRegistry, RemovingDefaultGivesTrueAndThenFalse) {
    EXPECT_TRUE(store->removeSource("default").get());
    EXPECT_FALSE(store->removeSource("default").get());
    EXPECT_THAT(names(), ElementsAre("override"));
}

TEST_F(SourceRegistry, RemovingAnUnknownNameGivesFalse) {
    EXPECT_FALSE(store->removeSource("missing").get());
    EXPECT_THAT(names(), ElementsAre("override", "default"));
}

TEST_F(SourceRegistry, RemovalKeepsTheOrderOfTheOthers) {
    for (const int order : {1, 2, 3}) add(std::to_string(order), "", order, {});
    store->removeSource("2");
    EXPECT_THAT(names(), ElementsAre("override", "1", "3", "default"));
}

TEST_F(SourceRegistry, RemovedNameIsFreeAgain) {
    store->removeSource("override");
    add("override", "", 7, {});
    EXPECT_THAT(names(), ElementsAre("override", "default"));
}

TEST_F(SourceRegistry, RemovedSourcesKeysAreGone) {
    add("extra", "", 5, {{"a", 1}});
    store->removeSource("extra");
    EXPECT_FALSE(store->has("a").get());
    EXPECT_THAT(store->keys().get(), IsEmpty());
}

TEST_F(SourceRegistry, RemovalUncoversTheNextSource) {
    add("lower", "", 6, {{"a", 2}});
    add("upper", "", 5, {{"a", 1}});
    store->removeSource("upper");
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(SourceRegistry, FindsASourceByItsName) {
    const auto source = addHooked("extra", "group", 5);
    EXPECT_EQ(store->findSource("extra").get(), source);
    EXPECT_EQ(store->findSource("group").get(), nullptr);
}

TEST_F(SourceRegistry, FindsNoSourceThatWasRemoved) {
    addHooked("extra", "", 5);
    store->removeSource("extra");
    EXPECT_EQ(store->findSource("extra").get(), nullptr);
}

TEST_F(SourceRegistry, RemovedSourceIsAskedForItsKeysOnly) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    store->removeSource("extra");
    EXPECT_THAT(source->calls, ElementsAre("keys"));
}

TEST_F(SourceRegistry, RemovedSourceKeepsTheListener) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    store->removeSource("extra");
    EXPECT_TRUE(source->listener);
    source->set("a", 2);
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(SourceRegistry, RemovedSourceIsReleasedBeforeTheRemovalReturns) {
    auto source = addHooked("extra", "", 5);
    bool destroyed = false;
    source->whenDestroyed = [&] { destroyed = true; };
    source.reset();
    EXPECT_FALSE(destroyed);
    store->removeSource("extra");
    EXPECT_TRUE(destroyed);
}

TEST_F(SourceRegistry, ThrowFromKeysDuringARemovalKeepsTheSource) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THROW(store->removeSource("extra"), std::logic_error);
    EXPECT_THAT(names(), ElementsAre("override", "extra", "default"));
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(SourceRegistry, StoreWithoutSourcesHoldsNothing) {
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_THAT(names(), IsEmpty());
    EXPECT_THAT(store->keys().get(), IsEmpty());
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(SourceRegistry, EntryKeepsItsFields) {
    const auto source = std::make_shared<InMemorySource>(ValueMap{});
    const ConfigurationImpl::ConfigurationSourceMap entry("name", "group.", 5, true, source);
    EXPECT_EQ(entry.name, "name");
    EXPECT_EQ(entry.group, "group.");
    EXPECT_EQ(entry.order, 5);
    EXPECT_TRUE(entry.readOnly);
    EXPECT_EQ(entry.source, source);
}

}  // namespace
}  // namespace velkor::configuration
