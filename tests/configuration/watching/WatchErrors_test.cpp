#include <gmock/gmock.h>

#include <boost/log/attributes/value_extraction.hpp>
#include <boost/log/core.hpp>
#include <boost/log/core/record_view.hpp>
#include <boost/log/sinks/sink.hpp>
#include <boost/smart_ptr/make_shared.hpp>
#include <mutex>
#include <stdexcept>
#include <streambuf>
#include <string>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/StandardErrorCapture.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;

class WatchErrors : public WatchTest {
protected:
    Watch watchAndThrow(const std::string& key) const {
        const Watch started = watch(key);
        started.subscriber->whenNext = [](const auto&) { throw std::runtime_error("subscriber"); };
        return started;
    }

    velkor::testing::StandardErrorCapture standardError;
};

TEST_F(WatchErrors, ThrowingSubscriberIsReportedOnStandardError) {
    const Watch started = watchAndThrow("net.port");
    set("net.port", 1);
    EXPECT_EQ(standardError.text(), "Error in configuration value subscriber: net.port\n");
}

TEST_F(WatchErrors, EveryThrowingSubscriberIsReported) {
    const Watch first = watchAndThrow("key");
    const Watch second = watchAndThrow("key");
    set("key", 1);
    EXPECT_EQ(standardError.text(),
              "Error in configuration value subscriber: key\n"
              "Error in configuration value subscriber: key\n");
}

TEST_F(WatchErrors, ExceptionOfAnyTypeIsReported) {
    const Watch started = watch("key");
    started.subscriber->whenNext = [](const auto&) { throw 42; };
    set("key", 1);
    EXPECT_EQ(standardError.text(), "Error in configuration value subscriber: key\n");
}

TEST_F(WatchErrors, OtherWatchersStillReceiveTheValue) {
    const Watch before = watch("key");
    const Watch throwing = watchAndThrow("key");
    const Watch after = watch("key");
    set("key", 1);
    EXPECT_THAT(before.values(), ElementsAre("int 1"));
    EXPECT_THAT(after.values(), ElementsAre("int 1"));
}

TEST_F(WatchErrors, WriteSucceeds) {
    const Watch started = watchAndThrow("key");
    EXPECT_EQ(velkor::testing::textOf(store->set("key", 1).get()), "int 1");
    EXPECT_EQ(valueOf("key"), "int 1");
}

TEST_F(WatchErrors, ThrowingSubscriberReceivesTheNextValue) {
    const Watch started = watchAndThrow("key");
    set("key", 1);
    set("key", 2);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(WatchErrors, AddedSourceIsReportedAlike) {
    const Watch started = watchAndThrow("key");
    add("source", "", 5, {{"key", 1}});
    EXPECT_EQ(standardError.text(), "Error in configuration value subscriber: key\n");
}

TEST_F(WatchErrors, RemovedSourceIsReportedAlike) {
    set("key", 1);
    add("high", "", -1, {{"key", 2}});
    const Watch started{store->watchOption("key")};
    started.subscriber->whenNext = [](const auto& value) {
        if (value == ConfigurationValue(1)) throw std::runtime_error("subscriber");
    };
    started.subscribe(velkor::testing::allValues);
    EXPECT_TRUE(store->removeSource("high").get());
    EXPECT_EQ(standardError.text(), "Error in configuration value subscriber: key\n");
}

TEST_F(WatchErrors, ExceptionOfTheFirstValueReachesTheSubscribersOwnCaller) {
    set("key", 1);
    const Watch started{store->watchOption("key")};
    started.subscriber->whenNext = [](const auto&) { throw std::runtime_error("subscriber"); };
    started.subscriber->firstRequest = 1;
    EXPECT_THROW(started.subscribe(0), std::runtime_error);
    EXPECT_EQ(standardError.text(), "");
}

TEST_F(WatchErrors, NothingIsWrittenWhenNobodyThrows) {
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_EQ(standardError.text(), "");
}

TEST_F(WatchErrors, MutexIsFreeAfterwards) {
    const Watch started = watchAndThrow("key");
    set("key", 1);
    EXPECT_TRUE(open->isFreeForOthers());
}

TEST_F(WatchErrors, UpdateEndsWithTheLockOwned) {
    set("key", 1);
    const Watch started{store->watchOption("key")};
    started.subscribe(0);
    std::unique_lock<std::recursive_mutex> lock(open->mutex);
    open->updatePublishers(lock, "key");
    EXPECT_TRUE(lock.owns_lock());
}

/// Accepts nothing.
class FullBuffer final : public std::streambuf {};

class WatchBrokenStandardError : public WatchTest {
protected:
    WatchBrokenStandardError() {
        std::cerr.exceptions(std::ios_base::badbit | std::ios_base::failbit);
        throwing.subscriber->whenNext = [](const auto&) { throw std::runtime_error("subscriber"); };
    }

    ~WatchBrokenStandardError() override { std::cerr.exceptions(std::ios_base::goodbit); }

    FullBuffer buffer;
    velkor::testing::StandardErrorRedirection redirection{buffer};
    Watch throwing = watch("key");
};

TEST_F(WatchBrokenStandardError, OtherWatchersStillReceiveTheValue) {
    const Watch after = watch("key");
    set("key", 1);
    EXPECT_THAT(after.values(), ElementsAre("int 1"));
}

TEST_F(WatchBrokenStandardError, StoreStaysUsable) {
    set("key", 1);
    EXPECT_TRUE(open->isFreeForOthers());
    EXPECT_EQ(valueOf("key"), "int 1");
}

TEST_F(WatchBrokenStandardError, UpdateEndsWithTheLockOwned) {
    set("key", 1);
    std::unique_lock<std::recursive_mutex> lock(open->mutex);
    open->updatePublishers(lock, "key");
    EXPECT_TRUE(lock.owns_lock());
}

/// Throws at every record of a watcher that is told.
class ThrowingSink final : public boost::log::sinks::sink {
public:
    ThrowingSink() : sink(false) {}
    bool will_consume(const boost::log::attribute_value_set&) override { return true; }
    void consume(const boost::log::record_view& record) override {
        const auto message = boost::log::extract<std::string>("Message", record);
        if (message && message.get().rfind("notifying watcher: ", 0) == 0) {
            throw std::runtime_error("sink");
        }
    }
    void flush() override {}
};

class WatchBrokenLog : public WatchErrors {
protected:
    WatchBrokenLog() { boost::log::core::get()->add_sink(sink); }
    ~WatchBrokenLog() override { boost::log::core::get()->remove_sink(sink); }

    velkor::testing::LogCapture enabled{"velkor::configuration"};
    boost::shared_ptr<ThrowingSink> sink = boost::make_shared<ThrowingSink>();
};

TEST_F(WatchBrokenLog, ExceptionOfTheRecordIsReportedLikeTheSubscribers) {
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_EQ(standardError.text(), "Error in configuration value subscriber: key\n");
}

TEST_F(WatchBrokenLog, UpdateEndsWithTheLockOwned) {
    const Watch started = watch("key");
    set("key", 1);
    std::unique_lock<std::recursive_mutex> lock(open->mutex);
    open->updatePublishers(lock, "key");
    EXPECT_TRUE(lock.owns_lock());
}

}  // namespace
}  // namespace velkor::configuration
