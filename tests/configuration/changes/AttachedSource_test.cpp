#include "configuration/sources/AttachedSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "tests/configuration/changes/ChangeTesting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;
using ::testing::IsEmpty;
using testing::thrownText;

// A source that knows its store and notes what the store tells it.
class HostedSource final : public HookedSource, public AttachedSource {
public:
    using HookedSource::HookedSource;

    void attach(std::weak_ptr<SourceHost> newHost) override {
        told.emplace_back("attach");
        if (whenAttached) whenAttached();
        host = std::move(newHost);
    }

    void detach() noexcept override { told.emplace_back("detach"); }

    // Changes a value and reports it to the store, as sources do.
    void change(const std::string& key, int value) {
        values[key] = value;
        if (listener) listener(key);
    }

    std::function<void()> whenAttached;
    std::vector<std::string> told;
    std::weak_ptr<SourceHost> host;
};

class AttachedSources : public ChangeTest {
protected:
    std::shared_ptr<HostedSource> addHosted(const std::string& name) const {
        auto source = std::make_shared<HostedSource>();
        EXPECT_TRUE(store->addSource(name, "", 0, false, source).get());
        return source;
    }
};

TEST_F(AttachedSources, AreToldOfTheirRegistrationAndItsEnd) {
    const auto source = addHosted("hosted");
    EXPECT_THAT(source->told, ElementsAre("attach"));
    store->removeSource("hosted").get();
    EXPECT_THAT(source->told, ElementsAre("attach", "detach"));
}

TEST_F(AttachedSources, AreToldWhenTheStoreGoes) {
    const auto source = addHosted("hosted");
    store.reset();
    open.reset();
    EXPECT_THAT(source->told, ElementsAre("attach", "detach"));
    EXPECT_TRUE(source->host.expired());
}

TEST_F(AttachedSources, OfOneStoreHaveTheSameHost) {
    const auto one = addHosted("one");
    const auto other = addHosted("other");
    EXPECT_NE(one->host.lock(), nullptr);
    EXPECT_EQ(one->host.lock(), other->host.lock());
}

TEST_F(AttachedSources, ThatRefuseTheStoreAreNotRegistered) {
    const auto source = std::make_shared<HostedSource>();
    source->whenAttached = [] { throw std::runtime_error("not here"); };
    EXPECT_EQ(
        thrownText<std::runtime_error>([&] { store->addSource("hosted", "", 0, false, source); }),
        "not here");
    EXPECT_THAT(names(), ElementsAre("override", "default"));
    EXPECT_THAT(source->told, ElementsAre("attach"));
}

TEST_F(AttachedSources, ChangeSeveralKeysTogether) {
    const auto source = addHosted("hosted");
    const Watch watched = watch("a");
    std::vector<std::string> seen;
    watched.subscriber->whenNext = [&](const auto&) { seen.push_back(valueOf("b")); };
    source->host.lock()->changeTogether([&] {
        source->change("a", 1);
        source->change("b", 2);
    });
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
    EXPECT_THAT(seen, ElementsAre("int 2"));
}

TEST_F(AttachedSources, AKeyReportedTwiceIsToldOnce) {
    const auto source = addHosted("hosted");
    const ChangeWatch followed = follow("");
    source->host.lock()->changeTogether([&] {
        source->change("a", 1);
        source->change("a", 2);
    });
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 2@hosted"));
}

TEST_F(AttachedSources, ChangesWithinAChangeAreToldWithIt) {
    const auto source = addHosted("hosted");
    const ChangeWatch followed = follow("");
    std::vector<std::string> before;
    source->host.lock()->changeTogether([&] {
        source->host.lock()->changeTogether([&] { source->change("a", 1); });
        before = followed.texts();
    });
    EXPECT_THAT(before, IsEmpty());
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@hosted"));
}

TEST_F(AttachedSources, WhatAChangeThrowsPassesOnWhenItsWatchersHaveBeenTold) {
    const auto source = addHosted("hosted");
    const ChangeWatch followed = follow("");
    const auto change = [&] {
        source->change("a", 1);
        throw std::runtime_error("interrupted");
    };
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source->host.lock()->changeTogether(change); }),
              "interrupted");
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@hosted"));
}

}  // namespace
}  // namespace velkor::configuration
