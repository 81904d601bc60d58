// A source whose threads are short of memory.

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <string>
#include <thread>

#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/ScarceMemory.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {
namespace {

using layers::EtcdOptions;
using layers::EtcdSource;

class EtcdScarceMemory : public ::testing::TestWithParam<Shortage> {
protected:
    static void SetUpTestSuite() { cluster = std::make_unique<EtcdCluster>(); }
    static void TearDownTestSuite() { cluster.reset(); }

    std::shared_ptr<EtcdSource> open() const {
        EtcdOptions options;
        options.shortestPause = options.longestPause = std::chrono::milliseconds(1);
        options.startWithin = 2 * patience;
        return EtcdSource::open(cluster->urls(), "p/", options);
    }

    static std::unique_ptr<EtcdCluster> cluster;
};

std::unique_ptr<EtcdCluster> EtcdScarceMemory::cluster;

// Of each write the n-th allocation of the source's threads fails.
TEST_P(EtcdScarceMemory, EndsNoThreadAndLosesNothing) {
    const auto source = open();
    constexpr int most = 300;
    for (int number = 0; number < most && !HasFailure(); ++number) {
        SCOPED_TRACE(number);
        Latch answered;
        bool isTaken = false;
        auto failure = std::make_unique<AllocationFailureElsewhere>(
            static_cast<std::size_t>(number), GetParam());
        source->set("key " + std::to_string(number % 7), std::to_string(number));
        const auto told = source->committed().then([&](Future<bool>&& answer) {
            try {
                isTaken = answer.get();
            } catch (const std::exception&) {
                isTaken = false;
            }
            answered.countDown();
            return true;
        });
        while (!failure->hasHappened() && !answered.isOpen()) std::this_thread::yield();
        failure.reset();
        ASSERT_TRUE(answered.wait());
        if (isTaken) {
            EXPECT_EQ(textOf(source->get("key " + std::to_string(number % 7))),
                      "string " + std::to_string(number));
        }
    }
    source->set("after", 1);
    EXPECT_TRUE(source->committed().get());
    EXPECT_TRUE(comesAbout([&] { return source->state().isWell; }));
    const auto other = open();
    for (const auto& key : other->keys()) {
        EXPECT_TRUE(comesAbout([&] {
            return source->has(key) && source->get(key) == other->get(key);
        })) << key;
    }
    EXPECT_EQ(source->keys(), other->keys());
}

INSTANTIATE_TEST_SUITE_P(Shortages, EtcdScarceMemory,
                         ::testing::Values(Shortage::once, Shortage::lasting),
                         testing::nameOfShortage);

}  // namespace
}  // namespace velkor::testing
