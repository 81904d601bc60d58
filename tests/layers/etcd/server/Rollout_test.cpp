// The example of a staged roll-out, and how much one transaction holds.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"

namespace velkor::testing {
namespace {

using ::testing::HasSubstr;

constexpr const char* tooMany = "etcd refused the write: etcdserver: too many operations";

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
    EXPECT_THAT(apply(fleet, 129).refusal(), HasSubstr(tooMany));
    EXPECT_TRUE(fleet.source->keys().empty());
}

// A key that is there takes two comparisons, one that isn't takes one.
TEST_F(EtcdTransaction, HoldsHalfAsManyPresentKeysThatAreCompared) {
    EtcdOptions options;
    options.compareAndSwap = true;
    FleetProcess fleet(cluster->urls(), prefix, options);
    EXPECT_EQ(apply(fleet, 128).refusal(), "");
    EXPECT_EQ(apply(fleet, 64).refusal(), "");
    EXPECT_THAT(apply(fleet, 65).refusal(), HasSubstr(tooMany));
}

TEST(EtcdRolloutExample, PrintsWhatIsShown) {
    const EtcdCluster cluster;
    const std::string program = std::getenv("VELKOR_ROLLOUT_EXAMPLE");
    const std::string shown = std::getenv("VELKOR_ROLLOUT_SHOWN");
    EXPECT_EQ(outputOf(program + " " + cluster.urls().front()), outputOf("cat " + shown));
}

}  // namespace
}  // namespace velkor::testing
