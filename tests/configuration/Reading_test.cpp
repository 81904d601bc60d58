#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::failureOf;
using ::testing::IsEmpty;
using ::testing::StrEq;
using testing::textOf;
using ::testing::ThrowsMessage;

using Reading = testing::StoreTest;

TEST_F(Reading, FreshStoreHasNothing) {
    EXPECT_FALSE(store->has("x").get());
    EXPECT_THAT(store->keys().get(), IsEmpty());
}

TEST_F(Reading, GetOfAMissingKeyFails) {
    auto answer = store->get("x");
    EXPECT_THAT([&] { answer.get(); }, ThrowsMessage<std::runtime_error>(
                                           StrEq("No option with the specified key was found: x")));
}

TEST_F(Reading, GetOptionOfAMissingKeyFailsWithTheSameText) {
    auto answer = store->getOption("x");
    EXPECT_THAT([&] { answer.get(); }, ThrowsMessage<std::runtime_error>(
                                           StrEq("No option with the specified key was found: x")));
}

TEST_F(Reading, MissingEmptyKeyFailsWithTheTrailingBlank) {
    EXPECT_EQ(failureOf(store->get("")), "No option with the specified key was found: ");
}

TEST_F(Reading, OverrideWinsOverALaterSource) {
    store->set("a", 1);
    add("extra", "", 5, {{"a", 2}});
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(sourceOf("a"), "override");
}

TEST_F(Reading, SourceOfAGroupHoldsPrefixedKeys) {
    add("extra", "net.", 5, {{"port", 80}});
    EXPECT_TRUE(store->has("net.port").get());
    EXPECT_FALSE(store->has("port").get());
    EXPECT_THAT(store->keys().get(), ElementsAre("net.port"));
}

TEST_F(Reading, GroupAppliesToItsOwnPrefixOnly) {
    const auto source = addHooked("extra", "net", 5);
    for (const std::string key : {"network.port", "net", "ne", "", "xnet.port", "Net.port"}) {
        EXPECT_FALSE(store->has(key).get());
    }
    EXPECT_THAT(source->calls, IsEmpty());
}

TEST_F(Reading, GroupAloneAsksTheSourceForTheEmptyKey) {
    const auto source = addHooked("extra", "net", 5, {{"", 7}});
    EXPECT_EQ(valueOf("net."), "int 7");
    EXPECT_THAT(source->calls, ElementsAre("has ", "get "));
}

TEST_F(Reading, EmptyKeyIsAskedOfSourcesWithoutAGroup) {
    add("plain", "", 6, {{"", 1}});
    const auto grouped = addHooked("grouped", "net", 5, {{"", 2}});
    EXPECT_EQ(valueOf(""), "int 1");
    EXPECT_THAT(grouped->calls, IsEmpty());
}

TEST_F(Reading, EarlierOfTwoSourcesAnswers) {
    add("later", "", 6, {{"a", 2}});
    add("earlier", "", 5, {{"a", 1}});
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(Reading, ReadOnlySourcesTakePart) {
    add("later", "", 6, {{"a", 2}});
    add("earlier", "", 5, {{"a", 1}}, true);
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(sourceOf("a"), "earlier");
}

TEST_F(Reading, NewerOfTwoSourcesOfOneOrderAnswers) {
    add("older", "", 5, {{"a", 1}});
    add("newer", "", 5, {{"a", 2}});
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Reading, DifferentGroupsMayHoldTheSameFullKey) {
    add("inner", "a.b", 6, {{"c", 1}});
    add("outer", "a", 5, {{"b.c", 2}});
    EXPECT_EQ(valueOf("a.b.c"), "int 2");
    EXPECT_EQ(sourceOf("a.b.c"), "outer");
    store->removeSource("outer");
    EXPECT_EQ(valueOf("a.b.c"), "int 1");
}

TEST_F(Reading, GroupsOfOneLengthAreToldApart) {
    add("one", "aa", 5, {{"k", 1}});
    add("two", "bb", 6, {{"k", 2}});
    add("three", "aa", 7, {{"only", 3}});
    EXPECT_EQ(valueOf("aa.k"), "int 1");
    EXPECT_EQ(valueOf("bb.k"), "int 2");
    EXPECT_EQ(valueOf("aa.only"), "int 3");
    EXPECT_FALSE(store->has("bb.only").get());
}

TEST_F(Reading, WalkStopsAtTheFirstSourceThatHasTheKey) {
    const auto later = addHooked("later", "", 6, {{"a", 2}});
    const auto earlier = addHooked("earlier", "", 5, {{"a", 1}});
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_THAT(earlier->calls, ElementsAre("has a", "get a"));
    EXPECT_THAT(later->calls, IsEmpty());
}

TEST_F(Reading, WalkAsksEachSourceOnceUntilOneHasTheKey) {
    const auto later = addHooked("later", "", 6, {{"a", 2}});
    const auto earlier = addHooked("earlier", "", 5);
    EXPECT_EQ(valueOf("a"), "int 2");
    EXPECT_THAT(earlier->calls, ElementsAre("has a"));
    EXPECT_THAT(later->calls, ElementsAre("has a", "get a"));
}

TEST_F(Reading, GetOptionWalksOnce) {
    const auto source = addHooked("extra", "", 5, {{"a", 2}});
    EXPECT_EQ(sourceOf("a"), "extra");
    EXPECT_THAT(source->calls, ElementsAre("has a", "get a"));
}

TEST_F(Reading, HasDoesNotReadTheValue) {
    const auto source = addHooked("extra", "", 5, {{"a", 2}});
    EXPECT_TRUE(store->has("a").get());
    EXPECT_THAT(source->calls, ElementsAre("has a"));
}

TEST_F(Reading, GetOptionKeepsTheKeyAsItWasAsked) {
    add("extra", "net", 5, {{"port", 80}});
    EXPECT_EQ(store->getOption("net.port").get().key, "net.port");
}

TEST_F(Reading, KeysOfSeveralSourcesAppearOnceAndSorted) {
    add("one", "", 5, {{"b", 1}, {"a", 1}, {"net.port", 1}});
    add("two", "", 6, {{"c", 1}, {"a", 2}}, true);
    add("three", "net", 7, {{"port", 2}, {"host", 2}});
    EXPECT_THAT(store->keys().get(), ElementsAre("a", "b", "c", "net.host", "net.port"));
}

TEST_F(Reading, KeysAreInByteOrderNotInPrecedenceOrder) {
    add("first", "z", -5, {{"a", 1}});
    add("last", "", 9, {{"\xC3\xA4", 1}, {"B", 1}, {"", 1}});
    EXPECT_THAT(store->keys().get(), ElementsAre("", "B", "z.a", "\xC3\xA4"));
}

TEST_F(Reading, ValueKeepsItsKind) {
    add("extra", "", 5, {{"u", std::u16string(u"x")}, {"n", std::string("x")}});
    EXPECT_EQ(valueOf("u"), "ustring x");
    EXPECT_EQ(valueOf("n"), "string x");
}

TEST_F(Reading, ThrowFromGetLeavesTheCallAndFreesTheStore) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    source->whenGet = [] { throw std::logic_error("no value"); };
    EXPECT_THAT([&] { store->get("a"); }, ThrowsMessage<std::logic_error>(StrEq("no value")));
    EXPECT_THAT([&] { store->getOption("a"); }, ThrowsMessage<std::logic_error>(StrEq("no value")));
    EXPECT_TRUE(testing::completes([store = store] { store->has("b"); }));
}

TEST_F(Reading, ThrowFromHasLeavesTheCallAndFreesTheStore) {
    const auto source = addHooked("extra", "", 5);
    source->whenHas = [] { throw std::logic_error("no answer"); };
    EXPECT_THROW(store->get("a"), std::logic_error);
    EXPECT_THROW(store->getOption("a"), std::logic_error);
    EXPECT_THROW(store->has("a"), std::logic_error);
    EXPECT_THROW(store->explain("a"), std::logic_error);
    EXPECT_TRUE(testing::completes([store = store] { store->keys(); }));
}

TEST_F(Reading, ThrowFromKeysLeavesTheCallAndFreesTheStore) {
    const auto source = addHooked("extra", "", 5);
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THROW(store->keys(), std::logic_error);
    EXPECT_TRUE(testing::completes([store = store] { store->has("b"); }));
}

// A store that shows what is meant for derived classes.
class ProbeStore : public ConfigurationImpl {
public:
    ConfigurationValue probeGet(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return doGet(lock, key);
    }
    Option probeGetOption(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return doGetOption(lock, key);
    }
    bool probeHas(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        const bool answer = doHas(lock, key);
        EXPECT_TRUE(lock.owns_lock());
        return answer;
    }
    bool isLockedForOthers() {
        bool locked = false;
        EXPECT_TRUE(testing::completes([&] {
            const std::unique_lock<std::recursive_mutex> lock(mutex, std::try_to_lock);
            locked = !lock.owns_lock();
        }));
        return locked;
    }
};

class ProtectedReading : public ::testing::Test {
protected:
    std::shared_ptr<ProbeStore> store = std::make_shared<ProbeStore>();
};

TEST_F(ProtectedReading, DoGetOfAMissingKeyThrowsATextOfItsOwn) {
    EXPECT_THAT([&] { store->probeGet("x"); },
                ThrowsMessage<std::runtime_error>(StrEq("No option value for key: x")));
}

TEST_F(ProtectedReading, DoGetOptionOfAMissingKeyThrowsATextOfItsOwn) {
    EXPECT_THAT([&] { store->probeGetOption("x"); },
                ThrowsMessage<std::runtime_error>(StrEq("No option for key: x")));
}

TEST_F(ProtectedReading, DoHasIsFalseForAMissingKey) {
    EXPECT_FALSE(store->probeHas("x"));
}

TEST_F(ProtectedReading, HelpersAnswerForAKeyThatIsThere) {
    store->addInMemorySource("extra", "net", 5, false, {{"port", 80}});
    EXPECT_TRUE(store->probeHas("net.port"));
    EXPECT_EQ(textOf(store->probeGet("net.port")), "int 80");
    EXPECT_EQ(store->probeGetOption("net.port").source, "extra");
}

TEST_F(ProtectedReading, SourcesAreCalledWithTheStoreLocked) {
    const auto source = std::make_shared<testing::HookedSource>();
    std::vector<std::string> calls;
    source->whenCalled = [&](const std::string& call) {
        calls.push_back(call);
        EXPECT_TRUE(store->isLockedForOthers()) << "during " << call;
    };
    store->addSource("extra", "", -5, false, source);
    store->set("a", 1);
    store->get("a");
    store->keys();
    store->explain("a");
    store->removeSource("extra");
    EXPECT_THAT(calls, ::testing::IsSupersetOf({"keys", "attach", "set a", "has a", "get a"}));
}

TEST_F(ProtectedReading, NothingIsLockedBetweenCalls) {
    store->set("a", 1);
    EXPECT_FALSE(store->isLockedForOthers());
}

TEST_F(ProtectedReading, HelpersSurviveASourceThatRemovesItself) {
    const auto probes = {+[](ProbeStore& probed) { probed.probeHas("a"); },
                         +[](ProbeStore& probed) { probed.probeGet("a"); },
                         +[](ProbeStore& probed) { probed.probeGetOption("a"); }};
    for (const auto probe : probes) {
        auto source = std::make_shared<testing::HookedSource>(
            testing::HookedSource::Table{{"a", ConfigurationValue(1)}});
        auto* const added = source.get();
        store->addSource("extra", "", -5, false, std::move(source));
        added->whenHas = [this] { store->removeSource("extra"); };
        probe(*store);
        EXPECT_FALSE(store->has("a").get());
    }
}

}  // namespace
}  // namespace velkor::configuration
