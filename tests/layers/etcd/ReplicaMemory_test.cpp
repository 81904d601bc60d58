// Values of the server and writes of the source that meet while memory is short.

#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "layers/etcd/detail/Replica.hpp"
#include "layers/etcd/detail/ValueText.hpp"
#include "tests/support/ScarceMemory.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::layers::etcd {
namespace {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using testing::failEachAllocation;
using testing::ScarceMemory;

/// A replica with two keys, both of which are written twice, as long as no memory has.
class Fixture {
public:
    Fixture() {
        replica.replaceAll(table, {{kept, old}, {taken, old}}, 3, false);
        first = write({{kept, 1}, {added, 1}, {taken, std::nullopt}});
        second = write({{kept, 2}});
    }

    std::string at(const std::string& key) const {
        const auto* const value = table.find(key);
        return value == nullptr ? "none" : testing::textOf(*value);
    }

    /// Does `step` again, as long as it takes.
    template <class Step>
    void untilDone(ScarceMemory& memory, Step step) {
        const bool isDone = memory.allows([&] { step(changed); });
        if (!isDone) step(changed);
    }

    const std::string kept = "a key whose text is too long to need no memory";
    const std::string added = kept + ", another one";
    const std::string taken = kept + ", the last one";
    const ConfigurationValue old = std::string("a text that is too long to need no memory");
    ValueTable table{ValueMap()};
    Replica replica;
    Replica::Keys changed;
    Group first;
    Group second;

private:
    using Writes = std::vector<std::pair<std::string, std::optional<ConfigurationValue>>>;

    Group write(const Writes& writes) {
        Group group;
        group.number = ++lastNumber;
        for (const auto& [key, value] : writes) {
            replica.write(table, key, value);
            group.writes.push_back(
                {key, value ? std::optional(toValueText(*value)) : std::nullopt});
        }
        return group;
    }

    std::int64_t lastNumber = 0;
};

TEST(EtcdReplicaMemory, ShortWhileWritesAreTakenCountsThemOnce) {
    failEachAllocation([](ScarceMemory& memory) {
        Fixture each;
        each.untilDone(memory, [&](Replica::Keys& changed) {
            each.replica.take(each.table, each.first, 4, changed);
        });
        EXPECT_EQ(each.at(each.kept), "int 2") << "is unanswered";
        each.replica.refuse(each.table, each.second, each.changed);
        EXPECT_EQ(each.at(each.kept), "int 1");
        EXPECT_EQ(each.at(each.added), "int 1");
        EXPECT_EQ(each.at(each.taken), "none");
        EXPECT_TRUE(each.replica.serverValues(each.table) ==
                    (ValueMap{{each.kept, 1}, {each.added, 1}}));
    });
}

TEST(EtcdReplicaMemory, ShortWhileWritesAreRefusedTakesThemBackOnce) {
    failEachAllocation([](ScarceMemory& memory) {
        Fixture each;
        each.untilDone(memory, [&](Replica::Keys& changed) {
            each.replica.refuse(each.table, each.first, changed);
        });
        EXPECT_EQ(each.at(each.kept), "int 2") << "is unanswered";
        each.replica.refuse(each.table, each.second, each.changed);
        EXPECT_EQ(each.at(each.kept), testing::textOf(each.old));
        EXPECT_EQ(each.at(each.taken), testing::textOf(each.old));
        EXPECT_EQ(each.at(each.added), "none");
    });
}

TEST(EtcdReplicaMemory, ShortWhileAnOutcomeIsSettledSettlesItOnce) {
    failEachAllocation([](ScarceMemory& memory) {
        Fixture each;
        const std::vector<KeyUpdate> found{
            {each.kept, 1}, {each.added, std::nullopt}, {each.taken, each.old}};
        each.untilDone(memory, [&](Replica::Keys& changed) {
            each.replica.settle(each.table, each.first, found, 4, changed);
        });
        each.replica.refuse(each.table, each.second, each.changed);
        EXPECT_EQ(each.at(each.kept), "int 1");
        EXPECT_EQ(each.at(each.added), "none");
        EXPECT_EQ(each.at(each.taken), testing::textOf(each.old));
    });
}

TEST(EtcdReplicaMemory, ShortWhileARevisionIsToldChangesNothing) {
    failEachAllocation([](ScarceMemory& memory) {
        Fixture each;
        each.untilDone(memory, [&](Replica::Keys&) {
            const auto before = each.table.keys();
            std::vector<KeyUpdate> updates{
                {each.kept, 7}, {"x" + each.kept, 7}, {"y" + each.kept, each.old}};
            try {
                each.replica.update(each.table, std::move(updates), 4);
            } catch (...) {
                EXPECT_TRUE(each.table.keys() == before);
                throw;
            }
        });
        EXPECT_EQ(each.at("x" + each.kept), "int 7");
        EXPECT_EQ(each.at("y" + each.kept), testing::textOf(each.old));
        EXPECT_EQ(each.at(each.kept), "int 2") << "is unanswered";
    });
}

}  // namespace
}  // namespace velkor::layers::etcd
