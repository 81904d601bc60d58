// A source and a server that is well.

#include "layers/etcd/EtcdSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <limits>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "layers/testing/detail/SampleValues.hpp"
#include "tests/layers/ProcessEnd.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FaultProxy.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

class EtcdSourceTest : public ::testing::Test {
protected:
    static void SetUpTestSuite() { cluster = std::make_unique<EtcdCluster>(); }
    static void TearDownTestSuite() { cluster.reset(); }

    static EtcdMember& member() { return (*cluster)[0]; }

    /// Each test has keys of its own.
    EtcdSourceTest() : prefix("p" + std::to_string(++number) + "/") {}

    void put(const std::string& key, const std::string& text) const {
        member().ctl("put " + quoted(prefix + key) + " -- " + quoted(text));
    }

    static std::unique_ptr<EtcdCluster> cluster;
    static int number;
    const std::string prefix;
};

std::unique_ptr<EtcdCluster> EtcdSourceTest::cluster;
int EtcdSourceTest::number = 0;

TEST_F(EtcdSourceTest, ReadsTheKeysOfItsPrefix) {
    put("server.port", R"({"type":"int","value":8080})");
    put("mode", "plain text");
    put("a/b \"c\"", "1");
    member().ctl("put " + prefix.substr(0, prefix.size() - 1) + "0 other");
    const FleetProcess fleet(cluster->urls(), prefix);
    EXPECT_THAT(fleet.source->keys(), ElementsAre("a/b \"c\"", "mode", "server.port"));
    EXPECT_EQ(fleet.at("server.port"), "int 8080");
    EXPECT_EQ(fleet.at("mode"), "string plain text");
}

TEST_F(EtcdSourceTest, ReadsAllKeysWithoutAPrefix) {
    put("x", "1");
    const FleetProcess fleet(cluster->urls(), "");
    EXPECT_EQ(fleet.at(prefix + "x"), "string 1");
    put("y", "2");
    EXPECT_TRUE(fleet.shows(prefix + "y", "string 2"));
}

TEST_F(EtcdSourceTest, TellsWhatOthersWrite) {
    FleetProcess fleet(cluster->urls(), prefix);
    put("a", "1");
    put("a", R"({"type":"bool","value":true})");
    member().ctl("del " + prefix + "a");
    put("b", "");
    EXPECT_TRUE(fleet.shows("b", "string "));
    EXPECT_THAT(fleet.told(4), ElementsAre("a=string 1", "a=bool true", "a", "b=string "));
}

TEST_F(EtcdSourceTest, CarriesEveryKindExactly) {
    const FleetProcess writer(cluster->urls(), prefix);
    const FleetProcess reader(cluster->urls(), prefix);
    std::vector<ConfigurationValue> values{
        true,
        -7,
        7U,
        0.1,
        std::u16string(1, u'\xD800'),
        std::string("\xFF\0z", 3),
        std::vector<bool>{true, false},
        std::vector<int>{1},
        std::vector<unsigned>{},
        std::vector<double>{std::numeric_limits<double>::infinity(), -0.0},
        std::vector<std::string>{"", "\x80"},
        std::vector<std::u16string>{u"\u00e9"}};
    ASSERT_EQ(values.size(), configuration::typeTags.size());
    for (const auto& value : values) writer.store->set(std::to_string(value.which()), value);
    EXPECT_EQ(writer.refusal(), "");
    EXPECT_TRUE(comesAbout([&] { return reader.source->keys().size() == values.size(); }));
    for (const auto& value : values) {
        EXPECT_TRUE(reader.source->get(std::to_string(value.which())) == value) << textOf(value);
    }
}

TEST_F(EtcdSourceTest, ReadsWhatItWrites) {
    FleetProcess fleet(cluster->urls(), prefix);
    fleet.store->set("a", 1);
    EXPECT_EQ(fleet.at("a"), "int 1");
    EXPECT_EQ(fleet.refusal(), "");
    EXPECT_EQ(member().ctl("get --print-value-only " + prefix + "a"),
              "{\"type\":\"int\",\"value\":1}\n");
    put("fence", "1");
    EXPECT_TRUE(fleet.shows("fence", "string 1"));
    EXPECT_THAT(fleet.told(2), ElementsAre("a=int 1", "fence=string 1"));
}

TEST_F(EtcdSourceTest, Unsets) {
    put("a", "1");
    FleetProcess fleet(cluster->urls(), prefix);
    fleet.store->unset("a");
    EXPECT_EQ(fleet.at("a"), "none");
    EXPECT_EQ(fleet.refusal(), "");
    EXPECT_EQ(member().ctl("get " + prefix + "a"), "");
    EXPECT_FALSE(fleet.source->unset("a"));
}

TEST_F(EtcdSourceTest, AppliesInOneTransaction) {
    const FleetProcess writer(cluster->urls(), prefix);
    writer.store->set("gone", 1);
    writer.store->apply({{"a", 1}, {"b", 1}, {"gone", std::nullopt}, {"a", 2}});
    EXPECT_EQ(writer.refusal(), "");
    EXPECT_EQ(member().ctl("get --print-value-only " + prefix + "a"),
              "{\"type\":\"int\",\"value\":2}\n");
    const std::string fields =
        member().ctl("get --prefix -w fields " + prefix + " | grep ModRevision | sort -u | wc -l");
    EXPECT_EQ(fields, "1\n");
    EXPECT_EQ(writer.source->keys().size(), 2U);
}

TEST_F(EtcdSourceTest, AppliesNothingWhenTheServerRefusesAPart) {
    const FleetProcess writer(cluster->urls(), prefix);
    std::vector<configuration::Change> changes;
    for (int i = 0; i < 129; ++i) changes.push_back({"k" + std::to_string(i), i});
    writer.store->apply(changes);
    EXPECT_EQ(writer.refusal(),
              "etcd refused the write: etcdserver: too many operations in txn request");
    EXPECT_TRUE(comesAbout([&] { return writer.source->keys().empty(); }));
    EXPECT_EQ(member().ctl("get --prefix " + prefix), "");
}

TEST_F(EtcdSourceTest, TellsAWholeRevision) {
    const FleetProcess writer(cluster->urls(), prefix);
    const auto reader = EtcdSource::open(cluster->urls(), prefix);
    std::atomic<bool> isTorn{false};
    reader->setChangeListener([&](const std::string&) {
        if (reader->keys().size() < 3) return;
        isTorn = isTorn || !(reader->get("a") == reader->get("b")) ||
                 !(reader->get("a") == reader->get("c"));
    });
    for (int i = 0; i < 50; ++i) writer.store->apply({{"a", i}, {"b", i}, {"c", i}});
    EXPECT_TRUE(
        comesAbout([&] { return reader->has("c") && reader->get("c") == ConfigurationValue(49); }));
    EXPECT_FALSE(isTorn);
}

TEST_F(EtcdSourceTest, TellsAllRevisionsInTheirOrder) {
    const FleetProcess writer(cluster->urls(), prefix);
    FleetProcess reader(cluster->urls(), prefix);
    std::vector<std::string> expected;
    for (int i = 0; i < 200; ++i) {
        writer.store->set("a", i);
        expected.push_back("a=int " + std::to_string(i));
    }
    EXPECT_TRUE(reader.shows("a", "int 199"));
    EXPECT_EQ(reader.told(expected.size()), expected);
}

TEST_F(EtcdSourceTest, SaysHowItStands) {
    FleetProcess fleet(cluster->urls(), prefix);
    put("a", "1");
    EXPECT_TRUE(fleet.shows("a", "string 1"));
    const auto state = fleet.source->state();
    EXPECT_TRUE(state.isWell);
    EXPECT_TRUE(state.since);
    EXPECT_TRUE(state.updated);
    EXPECT_EQ(state.lastError, "");
    EXPECT_EQ(fleet.detail("endpoint"), member().url());
    EXPECT_NE(fleet.detail("revision"), "");
    EXPECT_TRUE(comesAbout([&] { return *fleet.source->state().updated > *state.updated; }))
        << "Also without changes the values are known to be those of the server.";
}

TEST_F(EtcdSourceTest, OverwritesWhatItWroteItself) {
    EtcdOptions options;
    options.compareAndSwap = true;
    const FleetProcess fleet(cluster->urls(), prefix, options);
    for (int i = 0; i < 20; ++i) fleet.store->set("a", i);
    EXPECT_EQ(fleet.refusal(), "");
    fleet.store->unset("a");
    fleet.store->set("a", 1);
    EXPECT_EQ(fleet.refusal(), "");
}

/// A source that hears of nothing that others write, until its connections are cut.
class EtcdDeafSource : public EtcdSourceTest {
protected:
    EtcdDeafSource() {
        options.compareAndSwap = true;
        options.silence = std::chrono::minutes(1);
    }

    std::string refusalOf(FleetProcess& fleet, const std::string& key) const {
        fleet.store->set(key, 3);
        return fleet.refusal();
    }

    EtcdOptions options;
    FaultProxy proxy{member().port()};
};

TEST_F(EtcdDeafSource, RefusesToOverwriteWhatItHasNotSeen) {
    put("a", "1");
    put("gone", "1");
    FleetProcess fleet({proxy.url()}, prefix, options);
    proxy.stall();
    put("a", "other");
    put("new", "other");
    member().ctl("del " + prefix + "gone");
    for (const char* key : {"a", "new", "gone"}) {
        EXPECT_EQ(refusalOf(fleet, key),
                  "etcd refused the write: another has changed the key meanwhile");
    }
    proxy.cutOnce();
    EXPECT_TRUE(fleet.shows("a", "string other"));
    EXPECT_TRUE(fleet.shows("gone", "none"));
}

TEST_F(EtcdDeafSource, OverwritesAllTheSameUnlessItIsToCompare) {
    options.compareAndSwap = false;
    put("a", "1");
    FleetProcess fleet({proxy.url()}, prefix, options);
    proxy.stall();
    put("a", "other");
    put("new", "other");
    for (const char* key : {"a", "new"}) EXPECT_EQ(refusalOf(fleet, key), "");
    proxy.cutOnce();
    put("fence", "1");
    EXPECT_TRUE(fleet.shows("fence", "string 1"));
    EXPECT_EQ(fleet.at("a"), "int 3");
    EXPECT_EQ(member().ctl("get --print-value-only " + prefix + "a"),
              "{\"type\":\"int\",\"value\":3}\n");
}

TEST_F(EtcdSourceTest, RefusesAValueThatIsTooLarge) {
    EtcdOptions options;
    options.writeWithin = std::chrono::minutes(1);  // the gateway reads slowly
    const FleetProcess fleet(cluster->urls(), prefix, options);
    fleet.store->set("a", std::string(1'600'000, 'x'));
    EXPECT_EQ(fleet.refusal(), "etcd refused the write: etcdserver: request is too large");
    EXPECT_TRUE(fleet.shows("a", "none"));
}

TEST_F(EtcdSourceTest, AsksTheNextEndpoint) {
    const std::string nobody = "http://127.0.0.1:" + std::to_string(freePort());
    const FleetProcess fleet({nobody, member().url(), nobody}, prefix);
    fleet.store->set("a", 1);
    EXPECT_EQ(fleet.refusal(), "");
}

TEST_F(EtcdSourceTest, KeepsOneConnectionForReadingAndOneForWriting) {
    FaultProxy proxy(member().port());
    const FleetProcess fleet({proxy.url()}, prefix);
    EXPECT_EQ(proxy.count(), 1);
    for (int i = 0; i < 20; ++i) fleet.store->set("a", i);
    EXPECT_EQ(fleet.refusal(), "");
    EXPECT_EQ(proxy.count(), 2);
}

TEST_F(EtcdSourceTest, GoesOnWhateverWatchersThrow) {
    const auto source = EtcdSource::open(cluster->urls(), prefix);
    source->setChangeListener([](const std::string&) { throw 1; });
    put("a", "1");
    put("b", "1");
    EXPECT_TRUE(comesAbout([&] { return source->has("b"); }));
    EXPECT_EQ(source->state().lastError, "");
}

TEST_F(EtcdSourceTest, AgreesWithAllWhateverThreadsWriteAtOnce) {
    FleetProcess fleet(cluster->urls(), prefix);
    const FleetProcess other(cluster->urls(), prefix);
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 4; ++thread) {
        threads.emplace_back([&fleet, thread] {
            for (int i = 0; i < 40; ++i) {
                const std::string key = "k" + std::to_string((i + thread) % 5);
                fleet.store->set(key, 100 * thread + i);
                if (i % 3 == 0) fleet.source->unset(key);
                if (i % 4 == 0) fleet.store->apply({{"k0", i}, {"k1", thread}});
                EXPECT_EQ(i % 10 == 0 ? fleet.refusal() : "", "");
            }
        });
    }
    for (auto& each : threads) each.join();
    EXPECT_EQ(fleet.refusal(), "");
    put("fence", "1");
    ASSERT_TRUE(fleet.shows("fence", "string 1"));
    ASSERT_TRUE(other.shows("fence", "string 1"));
    EXPECT_EQ(fleet.source->keys(), other.source->keys());
    for (const auto& key : other.source->keys()) EXPECT_EQ(fleet.at(key), other.at(key)) << key;
}

TEST_F(EtcdSourceTest, MayEndWhileItIsWritten) {
    for (int round = 0; round < 5; ++round) {
        auto source = EtcdSource::open(cluster->urls(), prefix);
        std::vector<std::thread> threads;
        for (int thread = 0; thread < 3; ++thread) {
            threads.emplace_back([source, thread]() mutable {
                std::vector<Future<bool>> answers;
                for (int i = 0; i < 10 * thread + 5; ++i) {
                    source->set("k" + std::to_string(thread), i);
                    answers.push_back(source->committed());
                }
                source.reset();
                for (auto& each : answers) {
                    try {
                        each.get();
                    } catch (const std::runtime_error&) {
                        continue;  // given up at the end
                    }
                }
            });
        }
        source.reset();
        EXPECT_TRUE(completes([&] {
            for (auto& each : threads) each.join();
        }));
    }
}

TEST_F(EtcdSourceTest, MayEndInsideAWatcher) {
    Latch ended;
    auto source = EtcdSource::open(cluster->urls(), prefix);
    auto* const holder = &source;
    source->setChangeListener([&ended, holder](const std::string&) {
        holder->reset();
        ended.countDown();
    });
    put("a", "1");
    EXPECT_TRUE(ended.wait());
}

TEST_F(EtcdSourceTest, GivesUpWhatTheServerHasNotTakenAtItsEnd) {
    FaultProxy proxy(member().port());
    FleetProcess fleet({proxy.url()}, prefix);
    proxy.stallNew();
    fleet.store->set("a", 1);
    fleet.store->set("b", 1);
    ASSERT_TRUE(comesAbout([&] { return proxy.count() == 2; }));
    auto committed = fleet.source->committed();
    EXPECT_TRUE(completes([&] {
        fleet.store->removeSource("fleet").get();
        fleet.source.reset();
    }));
    EXPECT_THROW(committed.get(), std::runtime_error);
}

TEST_F(EtcdSourceTest, ServesReadersWhileTheServerIsSlow) {
    FaultProxy proxy(member().port());
    FleetProcess fleet({proxy.url()}, prefix);
    proxy.delay(std::chrono::milliseconds(50));
    put("a", "1");
    EXPECT_TRUE(fleet.shows("a", "string 1"));
    fleet.store->set("b", 2);
    EXPECT_EQ(fleet.at("b"), "int 2");
    EXPECT_EQ(fleet.refusal(), "");
}

TEST_F(EtcdSourceTest, IsWaitedForByTheEndOfTheProcessWhileItTells) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(endWhileTold(layers::EtcdSource::open(cluster->urls(), prefix),
                             [this](layers::EtcdSource&) { put("a", "1"); }),
                ::testing::ExitedWithCode(0), "waited for");
}

}  // namespace
}  // namespace velkor::testing
