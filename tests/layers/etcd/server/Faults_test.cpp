// A source and a server that fails, or what is in between.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FaultProxy.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using layers::StartWithoutServer;
using layers::UnknownOutcome;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;
using ::testing::UnorderedElementsAre;

/// Comes back soon.
EtcdOptions quick() {
    EtcdOptions options;
    options.writeWithin = patience;
    options.longestPause = std::chrono::milliseconds(400);
    return options;
}

/// Gives up soon, too.
EtcdOptions impatient() {
    EtcdOptions options = quick();
    options.silence = std::chrono::milliseconds(900);
    options.writeWithin = std::chrono::milliseconds(1500);
    return options;
}

/// A member, and something in between that fails. Each test has keys of its own.
class FaultyServer : public ::testing::Test {
protected:
    explicit FaultyServer(EtcdCluster& members)
        : cluster(members), prefix("p" + std::to_string(++number) + "/") {}

    void put(const std::string& key, const std::string& text) {
        cluster[0].ctl("put " + prefix + key + " -- " + quoted(text));
    }

    std::string valueAtServer(const std::string& key) {
        return cluster[0].ctl("get --print-value-only " + prefix + key);
    }

    FleetProcess follow(const EtcdOptions& options = quick()) {
        return FleetProcess({proxy.url()}, prefix, options);
    }

    static int number;
    EtcdCluster& cluster;
    const std::string prefix;
    FaultProxy proxy{cluster[0].port()};
};

int FaultyServer::number = 0;

/// All of these have one server, which is well again after each.
class EtcdFaults : public FaultyServer {
protected:
    static void SetUpTestSuite() { shared = std::make_unique<EtcdCluster>(); }
    static void TearDownTestSuite() { shared.reset(); }

    EtcdFaults() : FaultyServer(*shared) {}
    void TearDown() override { cluster[0].revive(); }

private:
    static std::unique_ptr<EtcdCluster> shared;
};

std::unique_ptr<EtcdCluster> EtcdFaults::shared;

struct OwnServer {
    EtcdCluster own;
};

/// One that takes a former state up.
class EtcdRestoredServer : private OwnServer, public FaultyServer {
protected:
    EtcdRestoredServer() : FaultyServer(own) {}

    std::string snapshot() const { return (cluster[0].place() / "snapshot").string(); }

    void save() { cluster[0].ctl("snapshot save " + snapshot()); }

    void restore() {
        cluster[0].kill();
        std::filesystem::remove_all(cluster[0].data());
        outputOf("ETCDCTL_API=3 etcdctl snapshot restore " + snapshot() + " --name=m0 --data-dir=" +
                 cluster[0].data().string() + " --initial-cluster=" + cluster[0].peer() +
                 " --initial-advertise-peer-urls=" + cluster[0].peer().substr(3));
        cluster[0].revive();
    }
};

TEST_F(EtcdFaults, OfTheConnectionLeaveTheValues) {
    put("a", "1");
    FleetProcess fleet = follow();
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    EXPECT_EQ(fleet.at("a"), "string 1");
    EXPECT_THAT(fleet.source->state().lastError, StartsWith(proxy.url() + ": "));
    EXPECT_EQ(fleet.detail("endpoint"), "");
    EXPECT_THAT(fleet.told(), IsEmpty());
}

TEST_F(EtcdFaults, OfTheConnectionLoseNoRevision) {
    FleetProcess fleet = follow();
    put("b", "1");
    ASSERT_TRUE(fleet.shows("b", "string 1"));
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    put("a", "1");
    put("a", "2");
    cluster[0].ctl("del " + prefix + "b");
    proxy.mend();
    ASSERT_TRUE(fleet.shows("b", "none"));
    EXPECT_TRUE(fleet.becomesWell());
    EXPECT_THAT(fleet.told(4), ElementsAre("b=string 1", "a=string 1", "a=string 2", "b"));
}

TEST_F(EtcdFaults, OfTheConnectionStandInTheLog) {
    const LogCapture log("velkor::layers::etcd", common::warning | common::error);
    FleetProcess fleet = follow();
    EXPECT_THAT(log.messages(), IsEmpty());
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    proxy.mend();
    ASSERT_TRUE(fleet.becomesWell());
    ASSERT_TRUE(comesAbout([&] { return log.messages().size() == 2; }));
    EXPECT_THAT(log.messages()[0], StartsWith("etcd is lost: " + proxy.url() + ": "));
    EXPECT_THAT(log.messages()[1], StartsWith("etcd is followed at " + proxy.url()));
}

TEST_F(EtcdFaults, InTheMiddleOfAnAnswerInventNothing) {
    FleetProcess fleet = follow();
    std::vector<std::string> expected;
    for (int i = 0; i < 12; ++i) {
        proxy.endAnswersAfter(static_cast<std::size_t>(1 + 37 * i));
        const std::string text(30, static_cast<char>('a' + i));
        put("a", text);
        ASSERT_TRUE(fleet.shows("a", "string " + text)) << i;
        expected.push_back("a=string " + text);
    }
    EXPECT_EQ(fleet.told(expected.size()), expected);
}

TEST_F(EtcdFaults, OfSilenceAreNoticed) {
    EtcdOptions options;
    FleetProcess fleet({proxy.url()}, prefix, options);
    proxy.stall();
    put("a", "1");
    ASSERT_TRUE(fleet.shows("a", "string 1")) << "by a new connection";
    EXPECT_EQ(fleet.source->state().lastError, proxy.url() + ": it is silent");
}

TEST_F(EtcdFaults, OfAFrozenMemberAreNoticed) {
    FleetProcess fleet(cluster.urls(), prefix, impatient());
    cluster[0].freeze();
    EXPECT_TRUE(fleet.becomesWell(false));
    cluster[0].thaw();
    EXPECT_TRUE(fleet.becomesWell());
    put("a", "1");
    EXPECT_TRUE(fleet.shows("a", "string 1"));
}

TEST_F(EtcdFaults, OfAKilledMemberLoseNothingThatWasTaken) {
    FleetProcess fleet(cluster.urls(), prefix, quick());
    for (int i = 0; i < 50; ++i) fleet.store->set("k" + std::to_string(i), i);
    ASSERT_EQ(fleet.refusal(), "");
    cluster[0].kill();
    ASSERT_TRUE(fleet.becomesWell(false));
    EXPECT_EQ(fleet.at("k49"), "int 49");
    cluster[0].start();
    ASSERT_TRUE(fleet.becomesWell());
    EXPECT_EQ(fleet.source->keys().size(), 50U);
    EXPECT_EQ(cluster[0].ctl("get --prefix --keys-only " + prefix + " | grep -c /"), "50\n");
    fleet.store->set("after", 1);
    EXPECT_EQ(fleet.refusal(), "");
}

TEST_F(EtcdFaults, BeyondACompactionTellWhatDiffers) {
    put("same", "1");
    put("changed", "1");
    put("gone", "1");
    FleetProcess fleet = follow();
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    put("changed", "2");
    put("changed", "3");
    put("new", "1");
    cluster[0].ctl("del " + prefix + "gone");
    cluster[0].ctl("compact $(ETCDCTL_API=3 etcdctl --endpoints=" + cluster[0].url() + " get " +
                   prefix + "new -w fields | sed -n 's/^\"Revision\" : //p')");
    proxy.mend();
    ASSERT_TRUE(fleet.becomesWell());
    ASSERT_TRUE(fleet.shows("new", "string 1"));
    EXPECT_THAT(fleet.told(3), UnorderedElementsAre("changed=string 3", "gone", "new=string 1"));
}

TEST_F(EtcdRestoredServer, IsFollowed) {
    put("a", "old");
    put("gone", "1");
    save();
    put("a", "new");
    put("b", "new");
    FleetProcess fleet = follow();
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    restore();
    proxy.mend();
    ASSERT_TRUE(fleet.becomesWell());
    EXPECT_TRUE(fleet.shows("a", "string old"));
    EXPECT_TRUE(fleet.shows("b", "none"));
    put("a", "newer");
    EXPECT_TRUE(fleet.shows("a", "string newer"));
    EXPECT_THAT(fleet.told(3), ElementsAre(StartsWith("a"), StartsWith("b"), "a=string newer"));
}

// The revision alone doesn't show that.
TEST_F(EtcdRestoredServer, IsFollowedAlsoWhenItHasGoneOn) {
    put("a", "old");
    save();
    put("b", "lost");
    FleetProcess fleet = follow();
    proxy.cut();
    ASSERT_TRUE(fleet.becomesWell(false));
    restore();
    for (int i = 0; i < 5; ++i) put("c", std::to_string(i));
    proxy.mend();
    EXPECT_TRUE(fleet.shows("b", "none"));
    EXPECT_TRUE(fleet.shows("c", "string 4"));
}

TEST_F(EtcdFaults, BeforeAWriteIsSentTakeItBack) {
    put("a", "1");
    FleetProcess fleet(cluster.urls(), prefix, impatient());
    cluster[0].kill();
    fleet.store->set("a", 2);
    EXPECT_EQ(fleet.at("a"), "int 2");
    EXPECT_EQ(fleet.refusal(), "etcd refused the write: the write was not sent: " +
                                   cluster[0].url() + ": Connection refused");
    EXPECT_TRUE(fleet.shows("a", "string 1"));
    cluster[0].start();
    EXPECT_TRUE(fleet.becomesWell());
    EXPECT_EQ(valueAtServer("a"), "1\n");
    EXPECT_THAT(fleet.told(2), ElementsAre("a=int 2", "a=string 1"));
}

TEST_F(EtcdFaults, WhileAWriteIsAnsweredLeaveItsOutcomeUnknownUntilItIsRead) {
    put("a", "1");
    FleetProcess fleet = follow(impatient());
    proxy.dropNewAnswers();
    fleet.store->set("a", 2);
    EXPECT_THAT(fleet.refusal<UnknownOutcome>(),
                StartsWith("etcd has not said whether it has written: " + proxy.url()));
    EXPECT_EQ(fleet.detail("waiting writes"), "");
    proxy.mend();
    EXPECT_TRUE(comesAbout([&] {
        fleet.store->set("b", 1);
        return fleet.refusal().empty();
    })) << "sent once the outcome is known";
    EXPECT_EQ(fleet.at("a"), "int 2");
    EXPECT_THAT(fleet.toldOf("a", 1), ElementsAre("a=int 2"));
}

TEST_F(EtcdFaults, WhileAWriteIsSentLeaveItsOutcomeUnknownUntilItIsRead) {
    put("a", "1");
    FleetProcess fleet = follow(impatient());
    proxy.stallNew();
    fleet.store->set("a", 2);
    EXPECT_THAT(fleet.refusal<UnknownOutcome>(),
                StartsWith("etcd has not said whether it has written: " + proxy.url()));
    proxy.mend();
    EXPECT_TRUE(fleet.shows("a", "string 1"));
    EXPECT_THAT(fleet.told(2), ElementsAre("a=int 2", "a=string 1"));
}

TEST_F(EtcdFaults, ThatLastRefuseWritesThatWaitForAnUnknownOutcome) {
    FleetProcess fleet = follow(impatient());
    proxy.stallNew();
    fleet.store->set("a", 1);
    EXPECT_THAT(fleet.refusal<UnknownOutcome>(), StartsWith("etcd has not said "));
    fleet.store->set("b", 1);
    ASSERT_TRUE(comesAbout([&] { return fleet.detail("waiting writes").empty(); }));
    EXPECT_THAT(fleet.refusal(), StartsWith("etcd refused the write: the write was not sent: "));
    EXPECT_TRUE(fleet.shows("b", "none"));
}

TEST_F(EtcdFaults, WhileManyKeysAreSentLeaveTheirOutcomeUnknownUntilItIsRead) {
    FleetProcess fleet = follow(impatient());
    proxy.stallNew();
    std::vector<configuration::Change> changes;
    for (int i = 0; i < 200; ++i) changes.push_back({"k" + std::to_string(i), i});
    fleet.store->apply(changes);
    EXPECT_THAT(fleet.refusal<UnknownOutcome>(), StartsWith("etcd has not said "));
    proxy.mend();
    EXPECT_TRUE(comesAbout([&] { return fleet.source->keys().empty(); }));
}

/// A write that the server gets long after it was given up.
class EtcdLateWrite : public EtcdFaults {
protected:
    EtcdLateWrite() {
        put("a", "1");
        fleet = std::make_unique<FleetProcess>(std::vector<std::string>{proxy.url()}, prefix,
                                               impatient());
        proxy.holdNew();
        fleet->store->set("a", 2);
        EXPECT_THAT(fleet->refusal<UnknownOutcome>(), StartsWith("etcd has not said "));
        proxy.mend();
        EXPECT_TRUE(fleet->shows("a", "string 1"));
    }

    std::unique_ptr<FleetProcess> fleet;
};

TEST_F(EtcdLateWrite, IsShownLikeAnybodys) {
    proxy.deliverHeld();
    EXPECT_TRUE(fleet->shows("a", "int 2"));
}

TEST_F(EtcdLateWrite, OverwritesNothingThatWasWrittenMeanwhile) {
    put("a", "3");
    proxy.deliverHeld();
    EXPECT_EQ(valueAtServer("a"), "3\n");
}

TEST_F(EtcdLateWrite, RevivesNothing) {
    cluster[0].ctl("del " + prefix + "a");
    proxy.deliverHeld();
    EXPECT_EQ(valueAtServer("a"), "");
}

TEST_F(EtcdFaults, AtTheStartEndIt) {
    EtcdOptions options;
    options.startWithin = std::chrono::seconds(1);
    proxy.cut();
    EXPECT_THAT(
        thrownText<std::runtime_error>([&] { EtcdSource::open({proxy.url()}, prefix, options); }),
        StartsWith("etcd could not be read: " + proxy.url() + ": "));
    proxy.mend();
    proxy.stallNew();
    EXPECT_THAT(
        thrownText<std::runtime_error>([&] { EtcdSource::open({proxy.url()}, prefix, options); }),
        StartsWith("etcd could not be read: " + proxy.url() + ": "));
}

TEST_F(EtcdFaults, AtTheStartAreWaitedOut) {
    put("a", "1");
    EtcdOptions options = quick();
    options.startWithin = 2 * patience;
    proxy.cut();
    std::thread repair([&] {
        EXPECT_TRUE(comesAbout([&] { return proxy.count() > 2; }));
        proxy.mend();
    });
    EXPECT_EQ(FleetProcess({proxy.url()}, prefix, options).at("a"), "string 1");
    repair.join();
}

TEST_F(EtcdFaults, AtTheStartCanBeLivedWithWithoutValues) {
    put("a", "1");
    EtcdOptions options = quick();
    options.startWithin = std::chrono::milliseconds(0);
    options.withoutServer = StartWithoutServer::empty;
    proxy.cut();
    FleetProcess fleet({proxy.url()}, prefix, options);
    EXPECT_THAT(fleet.source->keys(), IsEmpty());
    EXPECT_FALSE(fleet.source->state().isWell);
    EXPECT_FALSE(fleet.source->state().updated);
    proxy.mend();
    EXPECT_TRUE(fleet.shows("a", "string 1"));
}

class EtcdLastKnownStart : public EtcdFaults {
protected:
    EtcdLastKnownStart() {
        options.startWithin = std::chrono::milliseconds(100);
        options.withoutServer = StartWithoutServer::lastKnown;
        options.lastKnownFile = folder.parent() / "known";
    }

    const TemporaryFile folder{""};
    EtcdOptions options = quick();
};

TEST_F(EtcdLastKnownStart, HasTheValuesOfTheFile) {
    put("a", "1");
    std::string revision;
    {
        options.startWithin = patience;
        FleetProcess fleet({proxy.url()}, prefix, options);
        put("b", "1");
        ASSERT_TRUE(fleet.shows("b", "string 1"));
        proxy.stallNew();
        fleet.store->set("unanswered", 1);
        revision = fleet.detail("revision");
        proxy.cut();
    }
    options.startWithin = std::chrono::milliseconds(100);
    FleetProcess fleet({proxy.url()}, prefix, options);
    EXPECT_EQ(fleet.at("a"), "string 1");
    EXPECT_THAT(fleet.source->keys(), ElementsAre("a", "b"));
    EXPECT_FALSE(fleet.source->state().isWell);
    EXPECT_EQ(fleet.detail("revision"), revision);
    put("a", "2");
    put("a", "3");
    proxy.mend();
    EXPECT_TRUE(fleet.shows("a", "string 3"));
    EXPECT_THAT(fleet.told(2), ElementsAre("a=string 2", "a=string 3")) << "resumed by revision";
}

TEST_F(EtcdLastKnownStart, KeepsTheFileWhileItRuns) {
    options.startWithin = patience;
    const FleetProcess fleet(cluster.urls(), prefix, options);
    ASSERT_TRUE(comesAbout([&] { return std::filesystem::exists(options.lastKnownFile); }));
    const auto before = std::filesystem::last_write_time(options.lastKnownFile);
    put("a", "1");
    EXPECT_TRUE(comesAbout(
        [&] { return std::filesystem::last_write_time(options.lastKnownFile) > before; }));
}

TEST_F(EtcdLastKnownStart, IsRefusedWithoutTheFile) {
    proxy.cut();
    const std::string problem =
        thrownText<std::runtime_error>([&] { EtcdSource::open({proxy.url()}, prefix, options); });
    EXPECT_THAT(problem, StartsWith("etcd could not be read: " + proxy.url() + ": "));
    EXPECT_THAT(problem, HasSubstr("; " + options.lastKnownFile.string() + ": No such file"));
}

TEST(EtcdFullServer, RefusesAndKeepsWhatItHas) {
    EtcdCluster cluster(1, {"--quota-backend-bytes=1048576"});
    FleetProcess fleet(cluster.urls(), "p/", quick());
    fleet.store->set("a", 1);
    ASSERT_EQ(fleet.refusal(), "");
    std::string refusal;
    for (int i = 0; i < 50 && refusal.empty(); ++i) {
        fleet.store->set("big", std::string(100'000, static_cast<char>('a' + i % 26)));
        refusal = fleet.refusal();
    }
    EXPECT_EQ(refusal, "etcd refused the write: etcdserver: mvcc: database space exceeded");
    fleet.store->set("a", 2);
    EXPECT_EQ(fleet.refusal(), refusal);
    EXPECT_TRUE(fleet.shows("a", "int 1"));
    EXPECT_EQ(fleet.source->state().lastError, refusal);
    EXPECT_TRUE(fleet.source->state().isWell) << "It can be read.";
}

}  // namespace
}  // namespace velkor::testing
