// What becomes of values of the server and writes of the source that meet.

#include "layers/etcd/detail/Replica.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "layers/etcd/detail/ValueText.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::layers::etcd {
namespace {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::UnorderedElementsAre;

class EtcdReplica : public ::testing::Test {
protected:
    std::string at(const std::string& key) const {
        const auto* const value = table.find(key);
        return value == nullptr ? "none" : testing::textOf(*value);
    }

    Group write(const std::string& key, std::optional<ConfigurationValue> value) {
        auto prepared =
            Outbox::prepare({key, value ? std::optional(toValueText(*value)) : std::nullopt});
        replica.write(table, key, std::move(value));
        prepared.front().number = ++lastNumber;
        return std::move(prepared.front());
    }

    Replica::Keys tell(const std::string& key, std::optional<ConfigurationValue> value,
                       std::int64_t revision) {
        std::vector<KeyUpdate> updates;
        updates.push_back({key, std::move(value)});
        return replica.update(table, std::move(updates), revision);
    }

    Replica::Keys take(const Group& group, std::int64_t revision) {
        Replica::Keys changed;
        replica.take(table, group, revision, changed);
        return changed;
    }

    Replica::Keys refuse(const Group& group) {
        Replica::Keys changed;
        replica.refuse(table, group, changed);
        return changed;
    }

    ValueTable table{ValueMap()};
    Replica replica;
    std::int64_t lastNumber = 0;
};

TEST_F(EtcdReplica, TellsOnlyWhatDiffersWhenAllIsReadAgain) {
    replica.replaceAll(table, {{"same", 1}, {"other", 1}, {"gone", 1}}, 5, false);
    EXPECT_THAT(replica.replaceAll(table, {{"same", 1}, {"other", 2}, {"new", 3}}, 9, false),
                UnorderedElementsAre("other", "gone", "new"));
    EXPECT_EQ(at("gone"), "none");
    EXPECT_EQ(replica.revision(), 9);
}

TEST_F(EtcdReplica, TellsTheKeysOfARevisionTogether) {
    std::vector<KeyUpdate> updates{{"a", 1}, {"b", 2}};
    EXPECT_THAT(replica.update(table, std::move(updates), 3), ElementsAre("a", "b"));
    EXPECT_EQ(at("b"), "int 2");
}

TEST_F(EtcdReplica, TellsARemoval) {
    tell("a", 1, 3);
    EXPECT_THAT(tell("a", std::nullopt, 4), ElementsAre("a"));
    EXPECT_EQ(at("a"), "none");
}

TEST_F(EtcdReplica, ShowsAWriteAtOnce) {
    tell("a", 1, 3);
    write("a", 2);
    EXPECT_EQ(at("a"), "int 2");
}

TEST_F(EtcdReplica, ShowsNothingOlderThanAWriteThatIsUnanswered) {
    const Group group = write("a", 2);
    EXPECT_THAT(tell("a", 1, 3), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
    EXPECT_THAT(take(group, 4), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
}

TEST_F(EtcdReplica, ShowsNothingOlderThanAWriteThatWasTaken) {
    take(write("a", 2), 10);
    EXPECT_THAT(tell("a", 1, 9), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
}

TEST_F(EtcdReplica, TellsAnOwnWriteNotAgain) {
    take(write("a", 2), 10);
    EXPECT_THAT(tell("a", 2, 10), IsEmpty());
    EXPECT_THAT(tell("a", 3, 11), ElementsAre("a"));
}

TEST_F(EtcdReplica, TellsAnOwnWriteNotAgainThatTheStreamBringsFirst) {
    const Group group = write("a", 2);
    EXPECT_THAT(tell("a", 2, 10), IsEmpty());
    EXPECT_THAT(take(group, 10), IsEmpty());
}

TEST_F(EtcdReplica, ShowsWhatAnotherWroteAfterwards) {
    const Group group = write("a", 2);
    tell("a", 2, 10);
    tell("a", 3, 11);
    EXPECT_EQ(at("a"), "int 2");
    EXPECT_THAT(take(group, 10), ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 3");
}

TEST_F(EtcdReplica, TakesARefusedWriteBack) {
    tell("a", 1, 3);
    EXPECT_THAT(refuse(write("a", 2)), ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 1");
    EXPECT_THAT(refuse(write("new", 2)), ElementsAre("new"));
    EXPECT_EQ(at("new"), "none");
    EXPECT_THAT(refuse(write("a", std::nullopt)), ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 1");
}

TEST_F(EtcdReplica, TakesARefusedWriteBackToWhatTheServerHasByThen) {
    tell("a", 1, 3);
    const Group group = write("a", 2);
    tell("a", 5, 4);
    EXPECT_THAT(refuse(group), ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 5");
}

TEST_F(EtcdReplica, ShowsTheLastOfSeveralWrites) {
    const Group first = write("a", 1);
    const Group second = write("a", 2);
    EXPECT_THAT(take(first, 3), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
    EXPECT_THAT(refuse(second), ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 1");
}

TEST_F(EtcdReplica, SettlesAnUnknownOutcomeByWhatIsFound) {
    tell("a", 1, 3);
    const Group group = write("a", 2);
    Replica::Keys changed;
    replica.settle(table, group, {{"a", 1}}, 7, changed);
    EXPECT_THAT(changed, ElementsAre("a"));
    EXPECT_EQ(at("a"), "int 1");
    EXPECT_THAT(tell("a", 9, 6), IsEmpty());
    EXPECT_THAT(tell("a", 2, 8), ElementsAre("a"));
}

TEST_F(EtcdReplica, KeepsUnansweredWritesWhenAllIsReadAgain) {
    replica.replaceAll(table, {{"a", 1}}, 3, false);
    const Group group = write("a", 2);
    EXPECT_THAT(replica.replaceAll(table, {{"a", 5}}, 4, false), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
    refuse(group);
    EXPECT_EQ(at("a"), "int 5");
}

TEST_F(EtcdReplica, KeepsWhatWasTakenAfterTheRevisionThatIsRead) {
    take(write("a", 2), 10);
    take(write("gone", std::nullopt), 11);
    EXPECT_THAT(replica.replaceAll(table, {{"a", 1}, {"gone", 1}}, 9, false), IsEmpty());
    EXPECT_EQ(at("a"), "int 2");
    EXPECT_EQ(at("gone"), "none");
}

TEST_F(EtcdReplica, FollowsAServerThatBeginsAnew) {
    replica.replaceAll(table, {{"a", 1}}, 20, false);
    take(write("b", 2), 21);
    EXPECT_THAT(replica.replaceAll(table, {{"a", 7}}, 5, true), UnorderedElementsAre("a", "b"));
    EXPECT_EQ(at("b"), "none");
    EXPECT_THAT(tell("b", 3, 6), ElementsAre("b"));
}

TEST_F(EtcdReplica, KnowsWhatWasSeenOfAKey) {
    tell("a", 1, 5);
    EXPECT_TRUE(replica.seen(table, "a").exists);
    EXPECT_FALSE(replica.seen(table, "b").exists);
    EXPECT_EQ(replica.seen(table, "b").revision, 5);
    take(write("a", 2), 8);
    EXPECT_EQ(replica.seen(table, "a").revision, 8);
}

TEST_F(EtcdReplica, GivesWhatTheServerHas) {
    tell("a", 1, 5);
    tell("b", 1, 6);
    write("a", 2);
    write("b", std::nullopt);
    write("c", 3);
    const ValueMap values = replica.serverValues(table);
    EXPECT_TRUE(values == (ValueMap{{"a", 1}, {"b", 1}}));
}

}  // namespace
}  // namespace velkor::layers::etcd
