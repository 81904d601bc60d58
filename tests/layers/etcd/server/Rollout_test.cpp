// The example of a staged roll-out, and how much one transaction holds.

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"

namespace velkor::testing {
namespace {

constexpr const char* tooMany =
    "etcd refused the write: etcdserver: too many operations in txn request";

class EtcdTransaction : public ::testing::Test {
protected:
    static void SetUpTestSuite() { cluster = std::make_unique<EtcdCluster>(); }
    static void TearDownTestSuite() { cluster.reset(); }

    /// Each test has keys of its own.
    EtcdTransaction() : prefix("t" + std::to_string(++number) + "/") {}

    static FleetProcess& apply(FleetProcess& fleet, int keys) {
        std::vector<configuration::Change> changes;
        for (int i = 0; i < keys; ++i) changes.push_back({std::to_string(i), i});
        fleet.store->apply(changes).get();
        return fleet;
    }

    static std::unique_ptr<EtcdCluster> cluster;
    static int number;
    const std::string prefix;
};

std::unique_ptr<EtcdCluster> EtcdTransaction::cluster;
int EtcdTransaction::number = 0;

TEST_F(EtcdTransaction, Holds128Keys) {
    FleetProcess fleet(cluster->urls(), prefix);
    EXPECT_EQ(apply(fleet, 128).refusal(), "");
    EXPECT_EQ(apply(fleet, 128).refusal(), "");
}

TEST_F(EtcdTransaction, HoldsNoMore) {
    FleetProcess fleet(cluster->urls(), prefix);
    EXPECT_EQ(apply(fleet, 129).refusal(), tooMany);
    EXPECT_TRUE(fleet.source->keys().empty());
}

TEST_F(EtcdTransaction, HoldsNoMoreThanARequest) {
    FleetProcess fleet(cluster->urls(), prefix);
    fleet.store->set("a", std::string(1'500'000, 'x'));
    EXPECT_EQ(fleet.refusal(), "");
    fleet.store->set("a", std::string(1'600'000, 'x'));
    EXPECT_EQ(fleet.refusal(), "etcd refused the write: etcdserver: request is too large");
}

// A key that is there takes two comparisons, one that isn't takes one.
TEST_F(EtcdTransaction, HoldsHalfAsManyPresentKeysThatAreCompared) {
    EtcdOptions options;
    options.compareAndSwap = true;
    FleetProcess fleet(cluster->urls(), prefix, options);
    EXPECT_EQ(apply(fleet, 128).refusal(), "");
    EXPECT_EQ(apply(fleet, 64).refusal(), "");
    EXPECT_EQ(apply(fleet, 65).refusal(), tooMany);
}

TEST(EtcdRolloutExample, PrintsWhatIsShown) {
    const EtcdCluster cluster;
    const std::string program = std::getenv("VELKOR_ROLLOUT_EXAMPLE");
    const std::string shown = std::getenv("VELKOR_ROLLOUT_SHOWN");
    EXPECT_EQ(outputOf(program + " " + cluster.urls().front()), outputOf("cat " + shown));
}

}  // namespace
}  // namespace velkor::testing
