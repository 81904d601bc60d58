#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/testing/detail/ListenerRules.hpp"
#include "layers/testing/detail/SampleValues.hpp"
#include "layers/testing/detail/Trial.hpp"

// What a store makes of a source. Each rule is a function of the same name as its test.
namespace velkor::layers::testing::detail {

/// A source on trial, registered in a real store under the name and the group "trial", in front of
/// all others. It holds the first of the sample values for "contract.key", which is watched.
struct RegisteredTrial {
    RegisteredTrial(const MakeSubject& makeSubject, const SampleValues& value)
        : trial(makeSubject(), {{"contract.key", value[0]}}, Trial::Registration::byTheRule) {
        add();
        watch = reactive_streams::subscribe<ConfigurationValue>(
            *store->watchOption(key),
            {[seen = seen](const ConfigurationValue& next) { seen->note(next); },
             [ended = ended] { ended->note(true); }});
    }

    void add() { store->addSource("trial", "trial", -1, false, trial.source()).get(); }

    /// Gives the watched key another value, through the store if it is to be written, or none.
    void begin(Way way, const std::optional<ConfigurationValue>& value) {
        if (way == Way::byItself) {
            trial.begin(way, "contract.key", value);
        } else {
            store->set(key, value.value(), "trial").get();
        }
    }

    /// Whether the watcher comes to `value`.
    [[nodiscard]] bool arrivesAt(const ConfigurationValue& value) const {
        return seen->becomes(trial.patience(), [&](const auto& values) {
            return !values.empty() && isSame(values.back(), value);
        });
    }

    const std::string key = "trial.contract.key";
    const std::shared_ptr<Noted<ConfigurationValue>> seen =
        std::make_shared<Noted<ConfigurationValue>>();
    const std::shared_ptr<Noted<bool>> ended = std::make_shared<Noted<bool>>();
    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    Trial trial;  // takes the listener back before the store goes
    reactive_streams::SubscriptionHandle watch;
};

inline void watcherEndsOnTheLastValue(const MakeSubject& makeSubject) {
    const SampleValues value(*makeSubject());
    const auto ways = RegisteredTrial(makeSubject, value).trial.ways();
    if (ways.empty()) GTEST_SKIP() << "It never changes.";
    for (const Way way : ways) {
        SCOPED_TRACE(way);
        RegisteredTrial registered(makeSubject, value);
        ASSERT_TRUE(registered.arrivesAt(value[0]));
        registered.begin(way, value[1]);
        registered.begin(way, value[2]);
        registered.begin(way, value[3]);
        ASSERT_TRUE(registered.arrivesAt(value[3]));
        EXPECT_TRUE(isSame(registered.store->get(registered.key).get(), value[3]));

        if (!registered.trial.losesKeys(way)) continue;
        registered.store->set(registered.key, value[1], "default").get();
        registered.begin(way, {});
        EXPECT_TRUE(registered.arrivesAt(value[1])) << "what a lower layer holds for a lost key";
    }
}

inline void removedSourceCanBeAddedAgain(const MakeSubject& makeSubject) {
    const SampleValues value(*makeSubject());
    RegisteredTrial registered(makeSubject, value);
    ASSERT_TRUE(registered.arrivesAt(value[0]));
    const auto seenBefore = registered.seen->all().size();
    registered.store->removeSource("trial").get();
    EXPECT_FALSE(registered.store->has(registered.key).get());
    std::size_t last = 0;
    for (const Way way : registered.trial.ways()) {
        registered.trial.begin(way, "contract.key", value[++last]);
    }
    const ConfigurationValue ofAnotherLayer = std::string("of another layer");
    registered.store->set(registered.key, ofAnotherLayer, "default").get();
    ASSERT_TRUE(registered.arrivesAt(ofAnotherLayer));
    const auto seen = registered.seen->all();
    for (std::size_t i = seenBefore; i < seen.size(); ++i) {
        EXPECT_TRUE(isSame(seen[i], ofAnotherLayer)) << "after the source was removed";
    }

    registered.add();
    ASSERT_TRUE(registered.arrivesAt(value[last])) << "what became of it meanwhile";
    for (const Way way : registered.trial.ways()) {
        SCOPED_TRACE(way);
        registered.begin(way, value[++last]);
        EXPECT_TRUE(registered.arrivesAt(value[last]));
    }
}

inline void sourceOutlivesItsStore(const MakeSubject& makeSubject) {
    const SampleValues value(*makeSubject());
    for (const Way way : Trial(makeSubject(), {}).ways()) {
        Trial other(makeSubject(), {{"contract.first", value[0]}});
        if (takesItsListenerBack(other, way, value)) continue;
        GTEST_SKIP() << "It would call into a store that has gone.";
    }

    RegisteredTrial registered(makeSubject, value);
    ASSERT_TRUE(registered.arrivesAt(value[0]));
    registered.store.reset();
    ASSERT_TRUE(registered.ended->begins(registered.trial.patience()))
        << "Something still owns the store.";

    const auto source = registered.trial.source();
    EXPECT_TRUE(isSame(source->get("contract.key"), value[0]));
    for (const Way way : registered.trial.ways())
        registered.trial.begin(way, "contract.key", value[1]);
    EXPECT_TRUE(source->has("contract.key"));
}

}  // namespace velkor::layers::testing::detail
