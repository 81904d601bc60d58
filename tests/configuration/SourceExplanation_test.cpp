#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "tests/configuration/StoreTesting.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using testing::textOf;

class SourceExplanation : public testing::StoreTest {
protected:
    std::vector<std::string> explained(const std::string& key) const {
        std::vector<std::string> holders;
        for (const Option& option : store->explain(key).get()) {
            holders.push_back(option.key + "@" + option.source + "=" + textOf(option.value));
        }
        return holders;
    }
};

TEST_F(SourceExplanation, IsEmptyForAMissingKey) {
    EXPECT_THAT(explained("a"), IsEmpty());
}

TEST_F(SourceExplanation, NamesEveryHolderInOrderOfPrecedence) {
    store->set("a", 3, "default");
    add("extra", "", 5, {{"a", 2}});
    store->set("a", 1);
    EXPECT_THAT(explained("a"),
                ElementsAre("a@override=int 1", "a@extra=int 2", "a@default=int 3"));
}

TEST_F(SourceExplanation, FirstHolderIsTheEffectiveOne) {
    add("extra", "net", 5, {{"port", 2}});
    store->set("net.port", 3, "default");
    EXPECT_EQ(store->explain("net.port").get().front().source, sourceOf("net.port"));
}

TEST_F(SourceExplanation, LeavesOtherGroupsAndOtherKeysOut) {
    add("net", "net", 5, {{"port", 1}});
    add("host", "host", 5, {{"port", 2}});
    add("plain", "", 5, {{"port", 3}});
    EXPECT_THAT(explained("net.port"), ElementsAre("net.port@net=int 1"));
}

TEST_F(SourceExplanation, GivesTheFullKey) {
    add("net", "net", 5, {{"port", 1}});
    EXPECT_EQ(store->explain("net.port").get().front().key, "net.port");
}

TEST_F(SourceExplanation, IncludesReadOnlySources) {
    add("fixed", "", 5, {{"a", 1}}, true);
    EXPECT_THAT(explained("a"), ElementsAre("a@fixed=int 1"));
}

TEST_F(SourceExplanation, GroupsOfDifferentLengthsAreCutOffRightly) {
    add("one", "a", 5, {{"b.c", 1}});
    add("two", "a.b", 6, {{"c", 2}});
    add("three", "a", 7, {{"b.c", 3}});
    add("four", "", 8, {{"a.b.c", 4}});
    EXPECT_THAT(explained("a.b.c"), ElementsAre("a.b.c@one=int 1", "a.b.c@two=int 2",
                                                "a.b.c@three=int 3", "a.b.c@four=int 4"));
}

TEST_F(SourceExplanation, AsksNothingThatAnotherGroupHolds) {
    const auto source = addHooked("net", "net", 5);
    explained("host.port");
    EXPECT_THAT(source->calls, IsEmpty());
}

TEST_F(SourceExplanation, DescriptionAsksNoSource) {
    const auto source = addHooked("net", "net", 5);
    store->describeSources();
    EXPECT_THAT(source->calls, IsEmpty());
}

TEST_F(SourceExplanation, DescriptionFollowsChanges) {
    add("extra", "", 5, {});
    EXPECT_THAT(names(), ElementsAre("override", "extra", "default"));
    store->removeSource("override");
    EXPECT_THAT(names(), ElementsAre("extra", "default"));
}

TEST(FindSource, GivesTheOneThatIsRegisteredUnderTheName) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto source = std::make_shared<InMemorySource>(ValueMap{{"a", 1}});
    store->addSource("mine", "net", 5, false, source);
    EXPECT_EQ(store->findSource("mine").get(), source);
}

TEST(FindSource, GivesNullForANameThatNoSourceHas) {
    const auto store = std::make_shared<ConfigurationImpl>();
    EXPECT_EQ(store->findSource("mine").get(), nullptr);
}

}  // namespace
}  // namespace velkor::configuration
