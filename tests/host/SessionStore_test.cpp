#include "host/SessionStore.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <csignal>
#include <exception>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/sources/DurableSource.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/ValueText.hpp"
#include "tests/host/state/FakeState.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

class SessionStoreTest : public ::testing::Test {
protected:
    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{10});
};

TEST_F(SessionStoreTest, ReadsSmallFiles) {
    const TemporaryFile file("a=1\n");
    EXPECT_TRUE(store->addPropertyFileSource("n", "g", 5, true, file.widePath()).get());
    EXPECT_EQ(valueText(store->get("g.a").get()), "'1'");
}

TEST_F(SessionStoreTest, RefusesFilesAboveTheLimit) {
    EXPECT_EQ(thrownText<std::runtime_error>(
                  [this] { store->addPropertyFileSource("n", "", 5, true, u"/dev/zero"); }),
              "Property file is larger than 10 bytes: /dev/zero");
}

TEST_F(SessionStoreTest, EndsAListWhenItIsInterrupted) {
    const auto registry = std::make_shared<CommandRegistry>();
    const configuration::ConfigurationCommandProvider commands(store, registry);
    store->set("a", 1);
    const Interruption interruption;
    std::raise(SIGINT);
    EXPECT_THROW(registry->find("list")->run({}), Interrupted);
    Interruption::take();
    EXPECT_EQ(registry->find("list")->run({}), "a = 1\n");
}

TEST_F(SessionStoreTest, IsInterruptedOnTheThreadOfTheConsoleOnly) {
    store->set("a", 1);
    const Interruption interruption;
    std::raise(SIGINT);
    std::string read;
    std::thread request([&] {
        try {
            read = valueText(store->get("a").get());
        } catch (const std::exception& error) {
            read = error.what();
        }
    });
    request.join();
    EXPECT_EQ(read, "1");
    EXPECT_THROW(store->get("a"), Interrupted);
}

TEST_F(SessionStoreTest, LetsALayerThatLastsTakeThePlaceOfOverride) {
    const auto state = std::make_shared<FakeState>();
    store->set("a", 1);
    store->keepStateIn(state);
    const auto sources = store->describeSources().get();
    ASSERT_EQ(sources.size(), 2U);
    EXPECT_EQ(sources[0].name, "state");
    EXPECT_EQ(sources[0].order, 0);
    EXPECT_FALSE(sources[0].readOnly);
    EXPECT_EQ(sources[1].name, "default");
    store->set("a", 2);
    EXPECT_TRUE(state->values->has("a"));
    EXPECT_EQ(store->state(), state.get());
}

TEST_F(SessionStoreTest, AcknowledgesAtOnceWhatDoesNotLast) {
    EXPECT_EQ(store->state(), nullptr);
    store->set("a", 1);
    store->acknowledge();
}

/// A layer of the session's own that says when another machine has what was written.
class RemoteSource final : public configuration::InMemorySource,
                           public configuration::DurableSource {
public:
    RemoteSource() : InMemorySource(configuration::ValueMap()) {}

    Future<bool> committed() override {
        ++asked;
        return commit();
    }

    std::function<Future<bool>()> commit = [] { return makeReadyFuture(true); };
    int asked = 0;
};

TEST_F(SessionStoreTest, AcknowledgesWhenEachSourceHasWhatWasWritten) {
    const auto remote = std::make_shared<RemoteSource>();
    store->addSource("remote", "", 5, false, remote);
    store->acknowledge();
    EXPECT_EQ(remote->asked, 0);
    store->set("a", 1, "remote");
    store->acknowledge();
    EXPECT_EQ(remote->asked, 1);
}

TEST_F(SessionStoreTest, TellsWhyASourceHasNotTakenAWrite) {
    const auto remote = std::make_shared<RemoteSource>();
    const auto failure = std::make_exception_ptr(std::runtime_error("permission denied"));
    remote->commit = [&] { return makeFailedFuture<bool>(failure); };
    store->addSource("remote", "", 5, false, remote);
    store->set("a", 1, "remote");
    EXPECT_EQ(thrownText<std::runtime_error>([this] { store->acknowledge(); }),
              "permission denied");
}

class DurableSessionTest : public SessionStoreTest {
protected:
    DurableSessionTest() { store->keepStateIn(state); }

    std::shared_ptr<FakeState> state = std::make_shared<FakeState>();
};

TEST_F(DurableSessionTest, AcknowledgesWhenEverythingIsOnDisk) {
    Promise<bool> onDisk;
    std::atomic<bool> isThere{false};
    std::thread disk;
    state->commit = [&] {
        disk = std::thread([&] {
            isThere = true;
            onDisk.setValue(true);
        });
        return onDisk.getFuture();
    };
    store->set("a", 1);
    store->acknowledge();
    EXPECT_TRUE(isThere);
    disk.join();
}

TEST_F(DurableSessionTest, AcknowledgesEveryWriteOnce) {
    store->acknowledge();
    EXPECT_EQ(state->calls.size(), 0U);
    store->set("a", 1);
    store->set("b", "text", "default");
    store->acknowledge();
    EXPECT_EQ(state->calls.size(), 1U);
    store->get("a").get();
    store->acknowledge();
    EXPECT_EQ(state->calls.size(), 1U);
    store->set("a", 1, "state");
    store->acknowledge();
    EXPECT_EQ(state->calls.size(), 2U);
}

TEST_F(DurableSessionTest, TellsWhyAWriteDoesNotLastAndIsReadyForTheNext) {
    const auto failure = std::make_exception_ptr(std::runtime_error("a.db: no space"));
    state->commit = [&] { return makeFailedFuture<bool>(failure); };
    store->set("a", 1);
    EXPECT_EQ(thrownText<std::runtime_error>([this] { store->acknowledge(); }), "a.db: no space");
    store->acknowledge();
}

}  // namespace
}  // namespace velkor::host
