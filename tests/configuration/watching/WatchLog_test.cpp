#include <gmock/gmock.h>

#include <algorithm>
#include <chrono>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class WatchLog : public WatchTest {
protected:
    /// The records so far that begin with one of the words of watching.
    std::vector<std::string> watchLines() const {
        std::vector<std::string> lines;
        for (const auto& record : log.records()) {
            for (const std::string start :
                 {"watchOption: ", "updatePublishers: ", "notifying watcher: "}) {
                if (record.message.rfind(start, 0) == 0) lines.push_back(record.message);
            }
        }
        return lines;
    }

    velkor::testing::LogCapture log{"velkor::configuration"};
};

TEST_F(WatchLog, BeginningOfAWatchIsLogged) {
    const auto publisher = store->watchOption("net.port");
    EXPECT_THAT(watchLines(), ElementsAre("watchOption: net.port"));
}

TEST_F(WatchLog, UpdateAndEachWatcherAreLogged) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    set("key", 1);
    EXPECT_THAT(watchLines(),
                ElementsAre("watchOption: key", "watchOption: key", "updatePublishers: key",
                            "notifying watcher: key", "notifying watcher: key"));
}

TEST_F(WatchLog, UpdateWithoutAWatcherIsLogged) {
    set("key", 1);
    EXPECT_THAT(watchLines(), ElementsAre("updatePublishers: key"));
}

TEST_F(WatchLog, UpdateOfAVanishedKeyIsLoggedAndNoWatcherIs) {
    add("only", "", 5, {{"key", 1}});
    const Watch started = watch("key");
    EXPECT_TRUE(store->removeSource("only").get());
    EXPECT_THAT(watchLines(),
                ElementsAre("updatePublishers: key", "watchOption: key", "updatePublishers: key"));
}

TEST_F(WatchLog, AddedSourceLogsItsKeysInOrderWithTheGroup) {
    add("net", "net", 5, {{"b", 1}, {"a", 1}});
    EXPECT_THAT(watchLines(), ElementsAre("updatePublishers: net.a", "updatePublishers: net.b"));
}

TEST_F(WatchLog, RemovedSourceLogsItsKeysInOrderWithoutTheGroup) {
    add("net", "net", 5, {{"b", 1}, {"a", 1}});
    const velkor::testing::LogCapture removal("velkor::configuration");
    EXPECT_TRUE(store->removeSource("net").get());
    EXPECT_THAT(removal.messages(),
                ElementsAre("removeSource: net", "updatePublishers: a", "updatePublishers: b"));
}

TEST_F(WatchLog, RecordsAreOfSeverityEightInTheStoresChannel) {
    const Watch started = watch("key");
    set("key", 1);
    for (const auto& record : log.records()) {
        EXPECT_EQ(record.channel, "velkor::configuration");
        EXPECT_EQ(static_cast<unsigned>(record.severity), 8U);
    }
    EXPECT_FALSE(log.records().empty());
}

TEST_F(WatchLog, NothingIsLoggedWhileTheSeverityIsOff) {
    common::DiagnosticLogger::enable("velkor::configuration", velkor::testing::everySeverity & ~8U);
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_THAT(log.messages(), IsEmpty());
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchLog, BeginningOfAWatchIsLoggedBeforeTheMutexIsTaken) {
    std::unique_lock<std::recursive_mutex> held(open->mutex);
    std::thread watching([this] { store->watchOption("key"); });
    const auto deadline = std::chrono::steady_clock::now() + velkor::testing::patience;
    while (watchLines().empty() && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::yield();
    }
    EXPECT_THAT(watchLines(), ElementsAre("watchOption: key"));
    held.unlock();
    watching.join();
}

}  // namespace
}  // namespace velkor::configuration
