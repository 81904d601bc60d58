// Sources and a cluster of three members, some of which fail.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <iostream>
#include <map>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"

namespace velkor::testing {
namespace {

using layers::UnknownOutcome;
using ::testing::HasSubstr;

EtcdOptions patientWriter() {
    EtcdOptions options;
    options.silence = std::chrono::milliseconds(1500);
    options.writeWithin = std::chrono::seconds(10);
    options.longestPause = std::chrono::milliseconds(400);
    options.startWithin = 2 * patience;
    return options;
}

class EtcdThreeMembers : public ::testing::Test {
protected:
    ~EtcdThreeMembers() override {
        if (!HasFailure()) return;
        for (std::size_t i = 0; i < cluster.size(); ++i) std::cerr << cluster[i].report();
    }

    EtcdCluster cluster{3};
};

TEST_F(EtcdThreeMembers, GoOnWithoutTheirLeader) {
    EtcdOptions options = patientWriter();
    options.writeWithin = std::chrono::seconds(3);
    FleetProcess writer(cluster.urls(), "p/", options);
    FleetProcess reader(cluster.urls(), "p/", patientWriter());
    const std::size_t leader = cluster.leader();
    writer.store->set("a", 1);
    ASSERT_EQ(writer.refusal(), "");
    cluster[leader].kill();
    // What is sent while there is no leader, or another one, may be of unknown outcome.
    std::string refusal;
    const auto takes = [&](int value) {
        return comesAbout([&] {
            writer.store->set("a", value);
            refusal = writer.refusal();
            return refusal.empty();
        });
    };
    ASSERT_TRUE(takes(2)) << refusal;
    EXPECT_TRUE(reader.shows("a", "int 2"));
    cluster[leader].start();
    ASSERT_TRUE(takes(3)) << refusal;
    EXPECT_TRUE(reader.shows("a", "int 3"));
}

TEST_F(EtcdThreeMembers, AreLeftWhenTheyHaveNoLeader) {
    FleetProcess fleet({cluster[0].url()}, "p/", patientWriter());
    cluster[1].freeze();
    cluster[2].freeze();
    ASSERT_TRUE(fleet.becomesWell(false));
    EXPECT_THAT(fleet.source->state().lastError, HasSubstr(cluster[0].url()));
    cluster[1].thaw();
    cluster[2].thaw();
    EXPECT_TRUE(fleet.becomesWell());
}

TEST_F(EtcdThreeMembers, AreLeftWhenTheyAreFrozen) {
    FleetProcess fleet(cluster.urls(), "p/", patientWriter());
    const std::string endpoint = fleet.detail("endpoint");
    const auto urls = cluster.urls();
    const auto place = std::find(urls.begin(), urls.end(), endpoint) - urls.begin();
    cluster[static_cast<std::size_t>(place)].freeze();
    ASSERT_TRUE(comesAbout(
        [&] { return fleet.source->state().isWell && fleet.detail("endpoint") != endpoint; }));
    EXPECT_TRUE(comesAbout([&] {
        fleet.store->set("a", 1);
        return fleet.refusal().empty();
    }));
    cluster[static_cast<std::size_t>(place)].thaw();
}

/// Notes what a source shows of a number that only grows, and whether it ever went back.
class GrowingNumbers {
public:
    void watch(EtcdSource& source) {
        source.setChangeListener([this, &source](const std::string& key) {
            if (!source.has(key)) return;
            const int value = boost::get<int>(source.get(key));
            const std::lock_guard<std::mutex> lock(mutex);
            auto& highest = seen[key];
            wentBack = wentBack || value < highest;
            highest = std::max(highest, value);
        });
    }

    bool didGoBack() {
        const std::lock_guard<std::mutex> lock(mutex);
        return wentBack;
    }

private:
    std::mutex mutex;
    std::map<std::string, int> seen;  // guarded by mutex
    bool wentBack = false;            // guarded by mutex
};

// Members are killed and frozen at random, one at a time, while two write numbers that grow.
TEST_F(EtcdThreeMembers, LoseNothingAndAgreeInTheEnd) {
    std::vector<std::shared_ptr<EtcdSource>> readers;
    std::vector<std::unique_ptr<GrowingNumbers>> numbers;
    for (int i = 0; i < 3; ++i) {
        readers.push_back(EtcdSource::open(cluster.urls(), "p/", patientWriter()));
        numbers.push_back(std::make_unique<GrowingNumbers>());
        numbers.back()->watch(*readers.back());
    }
    std::atomic<bool> ended{false};
    std::vector<int> taken(2, 0);
    std::vector<std::thread> writers;
    for (std::size_t i = 0; i < 2; ++i) {
        writers.emplace_back([&, i] {
            const auto source = EtcdSource::open(cluster.urls(), "p/", patientWriter());
            for (int value = 1; !ended; ++value) {
                source->set("w" + std::to_string(i), value);
                try {
                    source->committed().get();
                    taken[i] = value;
                } catch (const std::runtime_error&) {
                    // Refused, or not known: it isn't acknowledged.
                    continue;
                }
            }
        });
    }
    std::minstd_rand random(7);
    for (int round = 0; round < 6; ++round) {
        EtcdMember& member = cluster[random() % 3];
        if (random() % 2 == 0) {
            member.kill();
            std::this_thread::sleep_for(std::chrono::milliseconds(700));
            member.start();
        } else {
            member.freeze();
            std::this_thread::sleep_for(std::chrono::milliseconds(2000));
            member.thaw();
        }
        ASSERT_TRUE(comesAbout([&] { return member.answers(); }));
    }
    ended = true;
    for (auto& writer : writers) writer.join();
    // A write of unknown outcome may still come: all have to agree with the server about it.
    ASSERT_TRUE(comesAbout([&] { return cluster[0].answers(); }));
    const auto last = EtcdSource::open(cluster.urls(), "p/", patientWriter());
    for (std::size_t i = 0; i < 2; ++i) {
        const std::string key = "w" + std::to_string(i);
        EXPECT_GT(taken[i], 0);
        EXPECT_GE(boost::get<int>(last->get(key)), taken[i]);
        for (const auto& reader : readers) {
            EXPECT_TRUE(comesAbout([&] { return reader->get(key) == last->get(key); })) << key;
        }
    }
    for (const auto& each : numbers) EXPECT_FALSE(each->didGoBack());
    for (const auto& reader : readers) reader->setChangeListener({});
}

}  // namespace
}  // namespace velkor::testing
