#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <locale>
#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <vector>

#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

const std::string inMemory = typeid(InMemorySource).name();

class StoreLog : public testing::StoreTest {
protected:
    template <class Callable>
    static std::vector<std::string> messagesOf(Callable callable) {
        const testing::LogCapture log("velkor::configuration", common::debug);
        callable();
        return log.messages();
    }
};

TEST_F(StoreLog, ConstructionAddsDefaultAndThenOverride) {
    EXPECT_THAT(messagesOf([] { ConfigurationImpl(); }),
                ElementsAre("addSource: default, , 2147483647, 0, " + inMemory,
                            "addSource: override, , 0, 0, " + inMemory));
}

TEST_F(StoreLog, AddedSourceIsLoggedWithTheGroupAsGiven) {
    EXPECT_THAT(messagesOf([&] { add("extra", "app", -5, {}, true); }),
                ElementsAre("addSource: extra, app, -5, 1, " + inMemory));
}

TEST_F(StoreLog, AddedSourceIsLoggedWithItsDynamicType) {
    const auto source = std::make_shared<testing::HookedSource>();
    EXPECT_THAT(messagesOf([&] { store->addSource("extra", "", 5, false, source); }),
                ElementsAre("addSource: extra, , 5, 0, " +
                            std::string(typeid(testing::HookedSource).name())));
}

TEST_F(StoreLog, AddedPropertyFileIsLoggedWithItsType) {
    const testing::TemporaryFile file("");
    EXPECT_THAT(
        messagesOf([&] { store->addPropertyFileSource("file", "", 5, true, file.widePath()); }),
        ElementsAre("addSource: file, , 5, 1, " + std::string(typeid(PropertyFileSource).name())));
}

TEST_F(StoreLog, RefusedSourceIsLoggedToo) {
    EXPECT_THAT(messagesOf([&] { store->addInMemorySource("override", "x", 5, false, {}); }),
                ElementsAre("addSource: override, x, 5, 0, " + inMemory));
}

TEST_F(StoreLog, NullSourceIsNotLogged) {
    EXPECT_THAT(messagesOf([&] { EXPECT_ANY_THROW(store->addSource("x", "", 5, false, nullptr)); }),
                IsEmpty());
}

TEST_F(StoreLog, AddedKeysAreUpdatedWithTheirPrefixInOrder) {
    EXPECT_THAT(
        messagesOf([&] {
            add("extra", "app", 5, {{"b", 1}, {"a", 2}});
        }),
        ElementsAre("addSource: extra, app, 5, 0, " + inMemory, "updatePublishers: app.a",
                    "get: app.a from extra", "updatePublishers: app.b", "get: app.b from extra"));
}

TEST_F(StoreLog, RemovedKeysAreUpdatedWithoutTheirPrefix) {
    add("extra", "app", 5, {{"b", 1}, {"a", 2}});
    EXPECT_THAT(messagesOf([&] { store->removeSource("extra"); }),
                ElementsAre("removeSource: extra", "updatePublishers: a", "updatePublishers: b"));
}

TEST_F(StoreLog, RemovalOfAnUnknownSourceIsLogged) {
    EXPECT_THAT(messagesOf([&] { store->removeSource("x"); }), ElementsAre("removeSource: x"));
}

TEST_F(StoreLog, RemovalLogsTheValueThatIsUncovered) {
    store->set("a", 1, "default");
    add("extra", "", 5, {{"a", 2}});
    EXPECT_THAT(messagesOf([&] { store->removeSource("extra"); }),
                ElementsAre("removeSource: extra", "updatePublishers: a", "get: a from default"));
}

TEST_F(StoreLog, ApplyNamesEachKeyAndItsSource) {
    store->set("b", 1);
    const auto messages = messagesOf([&] { store->apply({{"a", 1}, {"b", std::nullopt}}).get(); });
    EXPECT_THAT(messages, ::testing::Contains("set: a@override"));
    EXPECT_THAT(messages, ::testing::Contains("unset: b@override"));
}

TEST_F(StoreLog, GetNamesTheSource) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] { store->get("a"); }), ElementsAre("get: a from override"));
}

TEST_F(StoreLog, GetOptionNamesTheSource) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] { store->getOption("a"); }),
                ElementsAre("get option: a from override"));
}

TEST_F(StoreLog, GetIsLoggedBeforeTheSourceIsAsked) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    source->whenGet = [] { throw std::logic_error("no value"); };
    EXPECT_THAT(messagesOf([&] { EXPECT_ANY_THROW(store->get("a")); }),
                ElementsAre("get: a from extra"));
}

TEST_F(StoreLog, MissingKeysAreNotLogged) {
    EXPECT_THAT(messagesOf([&] {
                    store->get("a");
                    store->getOption("a");
                }),
                IsEmpty());
}

TEST_F(StoreLog, HasAndKeysAreNotLogged) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] {
                    store->has("a");
                    store->keys();
                    store->addEnvironmentSource("x", "", 0);
                }),
                IsEmpty());
}

TEST_F(StoreLog, WriteIsLoggedInThreeSteps) {
    EXPECT_THAT(
        messagesOf([&] { store->set("a", 1); }),
        ElementsAre("set: a", "set: a@override", "updatePublishers: a", "get: a from override"));
}

TEST_F(StoreLog, NamedWriteIsLoggedWithItsSource) {
    EXPECT_THAT(messagesOf([&] { store->set("a", 1, "default"); }),
                ElementsAre("set: a, default", "set: a@default", "updatePublishers: a",
                            "get: a from default"));
}

TEST_F(StoreLog, HiddenWriteLogsTheEffectiveSource) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] { store->set("a", 2, "default"); }),
                ElementsAre("set: a, default", "set: a@default", "updatePublishers: a",
                            "get: a from override"));
}

TEST_F(StoreLog, WriteIntoAGroupLogsTheFullKey) {
    add("net", "net", -5, {});
    EXPECT_THAT(messagesOf([&] { store->set("net.port", 1); }),
                ElementsAre("set: net.port", "set: net.port@net", "updatePublishers: net.port",
                            "get: net.port from net"));
}

TEST_F(StoreLog, RefusedWritesLogTheirFirstLineOnly) {
    EXPECT_THAT(messagesOf([&] { store->set("a", 1, "missing"); }), ElementsAre("set: a, missing"));
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_THAT(messagesOf([&] { store->set("a", 1); }), ElementsAre("set: a"));
}

TEST_F(StoreLog, WatchOfAMissingKeyLogsItsFirstLineOnly) {
    EXPECT_THAT(messagesOf([&] { store->watchOption("a"); }), ElementsAre("watchOption: a"));
}

TEST_F(StoreLog, WatchOfAKeyReadsItsValue) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] { store->watchOption("a"); }),
                ElementsAre("watchOption: a", "get: a from override"));
}

TEST_F(StoreLog, EachWatcherOfAWriteIsLogged) {
    const auto first = store->watchOption("a");
    const auto second = store->watchOption("a");
    const auto other = store->watchOption("b");
    EXPECT_THAT(
        messagesOf([&] { store->set("a", 1); }),
        ElementsAre("set: a", "set: a@override", "updatePublishers: a", "get: a from override",
                    "notifying watcher: a", "notifying watcher: a"));
}

TEST_F(StoreLog, WatcherOfAVanishedKeyIsNotLogged) {
    add("only", "", 5, {{"a", 1}});
    const auto watch = store->watchOption("a");
    EXPECT_THAT(messagesOf([&] { store->removeSource("only"); }),
                ElementsAre("removeSource: only", "updatePublishers: a"));
}

TEST_F(StoreLog, ChangeReportedByASourceIsLogged) {
    const auto source = addHooked("extra", "app", 5, {{"a", 1}});
    EXPECT_THAT(messagesOf([&] { source->listener("a"); }),
                ElementsAre("updatePublishers: app.a", "get: app.a from extra"));
}

TEST_F(StoreLog, ChangeReportedByARemovedSourceIsLogged) {
    const auto source = addHooked("extra", "app", 5, {{"a", 1}});
    store->removeSource("extra");
    EXPECT_THAT(messagesOf([&] { source->set("a", 2); }), ElementsAre("updatePublishers: app.a"));
}

TEST_F(StoreLog, ExplanationIsNotLogged) {
    store->set("a", 1);
    EXPECT_THAT(messagesOf([&] {
                    store->explain("a");
                    store->describeSources();
                }),
                IsEmpty());
}

TEST_F(StoreLog, EveryRecordHasTheSeverityDebug) {
    const testing::LogCapture log("velkor::configuration");
    add("extra", "", 5, {{"a", 1}});
    const auto watch = store->watchOption("a");
    store->set("a", 2);
    store->getOption("a");
    store->removeSource("extra");
    EXPECT_GT(log.records().size(), 8U);
    for (const auto& record : log.records()) EXPECT_EQ(record.severity, 8U) << record.message;
}

TEST_F(StoreLog, NothingIsWrittenByDefault) {
    EXPECT_EQ(testing::LogCapture::enabledSeverities("velkor::configuration") & 24U, 0U);
}

TEST_F(StoreLog, NothingIsWrittenWithoutTheSeverity) {
    const testing::LogCapture log("velkor::configuration", testing::everySeverity & ~common::debug);
    store->set("a", 1);
    store->get("a");
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(StoreLog, HostsNumbersChangeNothing) {
    const testing::ScopedGlobalLocale host(
        std::locale(std::locale::classic(), new testing::CommaNumbers));
    EXPECT_THAT(messagesOf([&] { add("extra", "", 1234567, {}, true); }),
                ElementsAre("addSource: extra, , 1234567, 1, " + inMemory));
}

/// Gives access to the mutex, to hold it against an operation.
class HeldStore : public ConfigurationImpl {
public:
    using ConfigurationImpl::mutex;
};

struct FirstLine {
    const char* name;
    std::function<void(ConfigurationImpl&)> operation;
    std::string line;
};

class StoreLogFirstLine : public ::testing::TestWithParam<FirstLine> {};

TEST_P(StoreLogFirstLine, IsWrittenBeforeTheMutexIsTaken) {
    const auto store = std::make_shared<HeldStore>();
    const testing::LogCapture log("velkor::configuration", common::debug);
    std::unique_lock<std::recursive_mutex> held(store->mutex);
    std::thread operating([&] { GetParam().operation(*store); });
    const auto deadline = std::chrono::steady_clock::now() + testing::patience;
    while (log.messages().empty() && std::chrono::steady_clock::now() < deadline) {
        std::this_thread::yield();
    }
    EXPECT_THAT(log.messages(), ElementsAre(GetParam().line));
    held.unlock();
    operating.join();
}

INSTANTIATE_TEST_SUITE_P(
    Operations, StoreLogFirstLine,
    ::testing::Values(
        FirstLine{"Set", [](auto& store) { store.set("k", 1); }, "set: k"},
        FirstLine{"SetByName", [](auto& store) { store.set("k", 1, "default"); },
                  "set: k, default"},
        FirstLine{"AddSource", [](auto& store) { store.addInMemorySource("s", "g", 1, false, {}); },
                  "addSource: s, g, 1, 0, " + inMemory},
        FirstLine{"RemoveSource", [](auto& store) { store.removeSource("default"); },
                  "removeSource: default"},
        FirstLine{"WatchOption", [](auto& store) { store.watchOption("k"); }, "watchOption: k"}),
    [](const auto& row) { return row.param.name; });

}  // namespace
}  // namespace velkor::configuration
