// The writes that wait for the server, and who waits for them.

#include "layers/etcd/detail/Outbox.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/Thrown.hpp"

namespace velkor::layers::etcd {
namespace {

using ::testing::ElementsAre;
using testing::thrownText;

class EtcdOutbox : public ::testing::Test {
protected:
    void accept(const std::string& key) { outbox.accept(Outbox::prepare({key, "1"})); }

    std::vector<std::string> next() {
        std::vector<std::string> keys;
        for (const Write& write : outbox.await()->writes) keys.push_back(write.key);
        return keys;
    }

    static std::string refusalOf(Future<bool> committed) {
        return thrownText<std::runtime_error>([&] { committed.get(); });
    }

    const std::exception_ptr full = std::make_exception_ptr(std::runtime_error("full"));
    Outbox outbox;
};

TEST_F(EtcdOutbox, MakesAGroupOfEachWrite) {
    accept("a");
    accept("b");
    EXPECT_THAT(next(), ElementsAre("a"));
    outbox.finish(nullptr);
    EXPECT_THAT(next(), ElementsAre("b"));
}

TEST_F(EtcdOutbox, MakesOneGroupOfWhatIsWrittenTogether) {
    outbox.beginGroup();
    outbox.beginGroup();
    accept("a");
    accept("b");
    outbox.endGroup();
    accept("a");
    outbox.endGroup();
    accept("c");
    EXPECT_THAT(next(), ElementsAre("a", "b", "a"));
}

TEST_F(EtcdOutbox, GroupsOnlyWhatTheSameThreadWrites) {
    outbox.beginGroup();
    std::thread([this] { accept("other"); }).join();
    accept("a");
    outbox.endGroup();
    EXPECT_THAT(next(), ElementsAre("other"));
}

TEST_F(EtcdOutbox, GoesOnWithAGroupThatOthersWriteBehind) {
    outbox.beginGroup();
    accept("a");
    std::thread([this] { accept("other"); }).join();
    accept("b");
    outbox.endGroup();
    EXPECT_THAT(next(), ElementsAre("a", "b"));
    outbox.finish(nullptr);
    EXPECT_THAT(next(), ElementsAre("other"));
}

TEST_F(EtcdOutbox, IsCommittedWhenNothingWaits) {
    EXPECT_TRUE(outbox.committed().get());
}

TEST_F(EtcdOutbox, AnswersWhenAllIsTaken) {
    accept("a");
    accept("b");
    bool answered = false;
    auto done = outbox.committed().then([&](Future<bool>&& result) {
        answered = true;
        return result.get();
    });
    outbox.finish(nullptr);
    EXPECT_FALSE(answered);
    outbox.finish(nullptr);
    EXPECT_TRUE(done.get());
}

TEST_F(EtcdOutbox, AnswersWithTheReasonOfWhatWasRefused) {
    accept("a");
    accept("b");
    auto committed = outbox.committed();
    outbox.finish(full);
    outbox.finish(nullptr);
    EXPECT_EQ(refusalOf(std::move(committed)), "full");
    EXPECT_TRUE(outbox.committed().get());
}

TEST_F(EtcdOutbox, TellsARefusalOnceToAThreadThatAsksLater) {
    accept("a");
    outbox.finish(full);
    std::thread([this] { EXPECT_TRUE(outbox.committed().get()); }).join();
    EXPECT_EQ(refusalOf(outbox.committed()), "full");
    EXPECT_TRUE(outbox.committed().get());
}

TEST_F(EtcdOutbox, TellsAThreadThatAsksLaterTheFirstReason) {
    accept("a");
    accept("b");
    outbox.finish(full);
    outbox.finish(std::make_exception_ptr(std::runtime_error("other")));
    EXPECT_EQ(refusalOf(outbox.committed()), "full");
}

TEST_F(EtcdOutbox, RefusesWhatWaitsAtTheEnd) {
    accept("a");
    auto committed = outbox.committed();
    outbox.end();
    EXPECT_EQ(outbox.await(), nullptr);
    outbox.refuseAll(full);
    EXPECT_EQ(refusalOf(std::move(committed)), "full");
    EXPECT_EQ(outbox.count(), 0U);
}

TEST_F(EtcdOutbox, HasRoomForAHundredThousandWrites) {
    for (int i = 0; i < 100'000; ++i) {
        ASSERT_TRUE(outbox.hasRoom());
        accept("a");
    }
    EXPECT_FALSE(outbox.hasRoom());
    outbox.finish(nullptr);
    EXPECT_TRUE(outbox.hasRoom());
}

TEST_F(EtcdOutbox, LetsLaterWritesHaveSeenWhatWasTaken) {
    accept("a");
    accept("a");
    accept("b");
    outbox.noteTaken(*outbox.await(), 9);
    outbox.finish(nullptr);
    EXPECT_EQ(outbox.await()->writes.front().seen.revision, 9);
    outbox.finish(nullptr);
    EXPECT_EQ(outbox.await()->writes.front().seen.revision, 0);
}

}  // namespace
}  // namespace velkor::layers::etcd
