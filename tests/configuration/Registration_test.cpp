#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <utility>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;

// Writes to a source that has no listener of the store, or not yet.
class Registration : public WatchTest {
protected:
    // A watch of `key` that runs `action` inside its first delivery.
    Watch watchOnce(const std::string& key, std::function<void()> action) const {
        Watch started = watch(key);
        started.subscriber->whenNext = [action = std::move(action),
                                        done = false](const ConfigurationValue&) mutable {
            if (!std::exchange(done, true)) action();
        };
        return started;
    }

    std::shared_ptr<HookedSource> source =
        std::make_shared<HookedSource>(HookedSource::Table{{"a", 1}});
};

TEST_F(Registration, WriteFromASubscriberThatIsToldOfTheSourceIsTold) {
    const Watch watched = watchOnce("a", [&] { store->set("a", 2, "new"); });
    store->addSource("new", "", 5, false, source);
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Registration, WriteOfAnotherThreadWhileWatchersAreToldIsTold) {
    const Watch watched = watchOnce("net.a", [&] {
        EXPECT_TRUE(testing::completes([store = store] { store->set("net.a", 2, "new"); }));
    });
    store->addSource("new", "net", 5, false, source);
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Registration, WriteToATableWhileWatchersAreToldIsTold) {
    const Watch watched = watchOnce("a", [&] { store->set("a", 2, "new"); });
    add("new", "", 5, {{"a", 1}});
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Registration, CallsOnTheSourceKeepTheirOrder) {
    const Watch watched = watch("a");
    store->addSource("new", "", 5, false, source);
    EXPECT_THAT(source->calls, ElementsAre("keys", "has a", "get a", "attach"));
}

TEST_F(Registration, WriteAfterItIsToldOnce) {
    const Watch watched = watch("a");
    store->addSource("new", "", 5, false, source);
    store->set("a", 2, "new");
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Registration, HiddenWriteToASourceWithoutAListenerTellsWhatIsEffective) {
    set("a", 7);
    const Watch watched = watchOnce("a", [] {});
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THROW(store->addSource("new", "", 5, false, source), std::logic_error);
    store->set("a", 2, "new");
    EXPECT_THAT(watched.values(), ElementsAre("int 7", "int 7"));
}

TEST_F(Registration, SourceThatKeptAListenerOfTheStoreIsToldOnce) {
    store->addSource("old", "", 5, false, source);
    store->removeSource("old");
    const Watch watched = watchOnce("a", [&] { store->set("a", 2, "new"); });
    store->addSource("new", "", 3, false, source);
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(Registration, SourceThatKeptItsListenerThroughAFailureIsToldOnce) {
    store->addSource("old", "", 5, false, source);
    store->removeSource("old");
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THROW(store->addSource("new", "", 3, false, source), std::logic_error);
    const Watch watched = watch("b");
    store->set("b", 2, "new");
    EXPECT_THAT(watched.values(), ElementsAre("int 2"));
}

TEST_F(Registration, ListenerOfAnotherGroupDoesNotStandForTheNewOne) {
    store->addSource("old", "net", 5, false, source);
    store->removeSource("old");
    const Watch watched = watchOnce("a", [&] { store->set("a", 2, "new"); });
    store->addSource("new", "", 3, false, source);
    EXPECT_THAT(watched.values(), ElementsAre("int 1", "int 2"));
}

/// A registration that ends early.
struct EarlyEnd {
    const char* name;
    std::function<void(HookedSource&)> prepare;
};

class EndedRegistration : public Registration, public ::testing::WithParamInterface<EarlyEnd> {};

TEST_P(EndedRegistration, LeavesASourceWhoseWritesAreTold) {
    const Watch watched = watch("net.b");
    GetParam().prepare(*source);
    EXPECT_ANY_THROW(store->addSource("new", "net", 5, false, source));
    *source = HookedSource();
    store->set("net.b", 2, "new");
    EXPECT_THAT(watched.values(), ElementsAre("int 2"));
}

INSTANTIATE_TEST_SUITE_P(
    By, EndedRegistration,
    ::testing::Values(
        EarlyEnd{"Keys",
                 [](auto& source) { source.whenKeys = [] { throw std::logic_error("keys"); }; }},
        EarlyEnd{"Has",
                 [](auto& source) { source.whenHas = [] { throw std::logic_error("has"); }; }},
        EarlyEnd{"Get",
                 [](auto& source) { source.whenGet = [] { throw std::logic_error("get"); }; }},
        EarlyEnd{"LackOfMemory",
                 [](auto& source) {
                     source.whenCalled = [](const std::string& call) {
                         if (call == "attach") throw std::bad_alloc();
                     };
                 }}),
    [](const auto& row) { return row.param.name; });

}  // namespace
}  // namespace velkor::configuration
