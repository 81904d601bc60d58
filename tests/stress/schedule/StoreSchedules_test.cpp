#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/stress/histories/StoreRound.hpp"
#include "tests/stress/schedule/Schedules.hpp"

namespace velkor::testing::schedule {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::OptionChange;
using reactive_streams::SubscriptionHandle;
using Kind = StoreCall::Kind;

StoreCall set(int value, const std::string& key = "a") {
    return {Kind::set, key, value};
}

StoreCall setIn(const std::string& source, int value) {
    return {Kind::set, "a", value, source};
}

StoreCall unset(const std::string& key = "a") {
    return {Kind::unset, key};
}

StoreCall get() {
    return {Kind::get, "a"};
}

StoreCall remove(const std::string& name) {
    return {Kind::remove, "", 0, name};
}

StoreCall add(const std::string& name, int value, int order = -2, const std::string& group = "") {
    StoreCall call{Kind::add};
    call.layer = {name, group, order, false, {{"a", value}, {"b", value + 1}}};
    return call;
}

StoreCall apply(int value) {
    StoreCall call{Kind::apply};
    call.changes = {{"a", value}, {"b", value + 1}};
    return call;
}

StoreCall read() {
    StoreCall call{Kind::read};
    call.keys = {"a", "b", "g.a", "g.b"};
    return call;
}

/// Calls whose answers must be those of one after the other, however the threads meet.
struct Meeting {
    const char* name;
    std::vector<StoreCall> first;
    std::vector<std::vector<StoreCall>> scripts;
    bool watched = false;
};

class StoreMeetings : public Schedules, public ::testing::WithParamInterface<Meeting> {};

TEST_P(StoreMeetings, AreThoseOfOneCallAfterTheOther) {
    expectAlways([](const Together& together) {
        RoundPlan plan;
        plan.first = GetParam().first;
        plan.scripts = GetParam().scripts;
        plan.threads = plan.scripts.size();
        plan.watched = GetParam().watched;
        plan.together = together;
        StoreSubject subject;
        const std::string complaint = StoreRound::complaintOf(subject, plan);
        require(complaint.empty(), complaint);
    });
}

// Sources of an odd order are somebody else's: there are points within their calls.
INSTANTIATE_TEST_SUITE_P(
    , StoreMeetings,
    ::testing::ValuesIn(std::vector<Meeting>{
        {"TwoRegistrationsOfAName", {}, {{add("one", 1)}, {add("one", 2)}}},
        {"TwoRegistrationsOfAForeignName", {}, {{add("one", 1, -1)}, {add("one", 2, -1)}}},
        {"TwoRegistrations", {}, {{add("one", 1), get()}, {add("two", 2, -1), get()}}},
        {"TwoRemovals", {add("one", 1)}, {{remove("one")}, {remove("one"), get()}}},
        {"RegistrationAndRemoval", {}, {{add("one", 1), get()}, {remove("one"), read()}}},
        {"WriteAndRemoval", {add("one", 1)}, {{set(2), get()}, {remove("one"), get()}}},
        {"WriteAndForeignRemoval", {add("one", 1, -1)}, {{set(2), get()}, {remove("one"), get()}}},
        {"WriteAndRegistration", {}, {{set(2), get()}, {add("one", 1), get()}}},
        {"WriteByNameAndRemoval",
         {add("one", 1)},
         {{setIn("one", 2)}, {remove("one"), add("one", 3)}}},
        {"TwoWrites", {}, {{set(1), get()}, {set(2), get()}}},
        {"TwoWritesAndAnUnset", {}, {{set(1)}, {set(2)}, {unset(), get()}}},
        {"WriteAndUnsetOfAForeignSource", {add("one", 1, -1)}, {{set(2), get()}, {unset(), get()}}},
        {"ApplyAndRead", {}, {{apply(1), apply(3)}, {read(), read()}}},
        {"ApplyAndForeignRead", {add("one", 9, -1)}, {{apply(1)}, {read(), read()}}},
        {"TwoApplies", {}, {{apply(1), read()}, {apply(3), read()}}},
        {"ApplyAndRemoval", {add("one", 9, -1)}, {{apply(1), get()}, {remove("one"), read()}}},
        {"KeysAndRegistration",
         {},
         {{{Kind::keys}, {Kind::describe}}, {add("one", 1, -1, "g."), remove("one")}}},
        {"ExplainAndRemoval",
         {add("one", 1, -1), set(2)},
         {{{Kind::explain, "a"}, {Kind::explain, "a"}}, {remove("one")}}},
        {"WatchedWrites", {}, {{set(1)}, {set(2)}}, true},
        {"WatchedWriteAndUnset", {set(1)}, {{set(2)}, {unset()}}, true},
        {"WatchedWriteAndRegistration", {}, {{set(1)}, {add("one", 2)}}, true},
        {"WatchedWriteAndRemoval", {add("one", 1)}, {{set(2)}, {remove("one")}}, true},
    }),
    [](const auto& meeting) { return meeting.param.name; });

/// Histories of random calls, as elsewhere, by schedules of chance.
class ScheduledHistories : public Schedules, public ::testing::WithParamInterface<bool> {};

TEST_P(ScheduledHistories, AreThoseOfOneCallAfterTheOther) {
    constexpr unsigned plans = 20;
    for (unsigned seed = 1; seed <= plans && !HasFailure(); ++seed) {
        const auto scenario = [seed](const Together& together) {
            RoundPlan plan;
            plan.seed = seed;
            plan.threads = 3;
            plan.calls = 4;
            plan.everything = GetParam();
            plan.together = together;
            StoreSubject subject;
            const std::string complaint = StoreRound::complaintOf(subject, plan);
            require(complaint.empty(), complaint);
        };
        expectAlways(scenario, {0, 20, seed * 1000});
    }
}

INSTANTIATE_TEST_SUITE_P(, ScheduledHistories, ::testing::Values(true, false),
                         [](const auto& chosen) {
                             return chosen.param ? "Everything" : "WritesAndTheirWatchers";
                         });

/// A store, and somebody who watches one of its keys.
struct WatchedStore {
    explicit WatchedStore(reactive_streams::Demand demand = reactive_streams::Demand::unbounded)
        : wanted(demand) {}

    void watch() {
        publisher = store->watchOption("a");
        handle = reactive_streams::subscribe(*publisher,
                                             {[this](const ConfigurationValue& value) {
                                                  told.push_back(boost::get<int>(value));
                                                  whenTold();
                                              },
                                              [this] { ++completions; }},
                                             wanted);
    }

    void set(int value) const { store->set("a", value).get(); }

    void requireTold(int value) const {
        require(!told.empty(), "nothing was told");
        requireEqual(told.back(), value, "the last value");
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::vector<int> told;
    int completions = 0;
    std::function<void()> whenTold = [] {};
    reactive_streams::Demand wanted;
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> publisher;
    SubscriptionHandle handle;
};

class StoreSchedules : public Schedules {};

TEST_F(StoreSchedules, AWatchBegunBesideAWriteKeepsTheNewerValue) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.set(1);
        together({[&] { watched.publisher = watched.store->watchOption("a"); },
                  [&] { watched.set(2); }});
        int last = 0;
        const auto handle = reactive_streams::subscribe(
            *watched.publisher,
            {[&](const ConfigurationValue& value) { last = boost::get<int>(value); }});
        requireEqual(last, 2, "the last value");
    });
}

TEST_F(StoreSchedules, AWatchBesideAWriteIsToldOfIt) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.set(1);
        together({[&] { watched.watch(); }, [&] { watched.set(2); }});
        const auto& told = watched.told;
        require(!told.empty() && (told.front() == 2 || told.back() == 2), "a write was not told");
    });
}

TEST_F(StoreSchedules, WatchersEndOnTheStoresValue) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        together({[&] { watched.set(1); }, [&] { watched.set(2); }});
        requireEqual(watched.told.size(), 2U, "values");
        watched.requireTold(boost::get<int>(watched.store->get("a").get()));
    });
}

TEST_F(StoreSchedules, ChangesEndOnTheStoresValue) {
    expectAlways([](const Together& together) {
        const auto store = std::make_shared<ConfigurationImpl>();
        std::vector<OptionChange> told;
        const auto handle = reactive_streams::subscribe(
            *store->watchChanges(""),
            {[&](const OptionChange& change) { told.push_back(change); }});
        together({[&] { store->set("a", 1).get(); }, [&] { store->set("a", 2).get(); },
                  [&] { store->unset("a").get(); }});
        require(!told.empty(), "nothing was told");
        const bool known = store->has("a").get();
        require(told.back().option.has_value() == known, "the last change is not the truth");
        if (known) {
            require(told.back().option->value == store->get("a").get(), "the last value is old");
        }
        for (std::size_t i = 1; i < told.size(); ++i) {
            require(told[i - 1].version < told[i].version, "a version came twice or late");
        }
    });
}

TEST_F(StoreSchedules, NothingBeginsAfterACancel) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        together({[&] { watched.handle = SubscriptionHandle(); }, [&] { watched.set(1); }});
        const auto told = watched.told;
        watched.set(2);
        require(watched.told == told, "a value came after the end of the watch");
    });
}

TEST_F(StoreSchedules, AWatchThatIsCancelledByItsCallbackEnds) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        watched.whenTold = [&] { watched.handle = SubscriptionHandle(); };
        together({[&] { watched.set(1); }, [&] { watched.set(2); }});
        require(!watched.told.empty(), "nothing was told");
        const auto told = watched.told;
        watched.set(3);
        require(watched.told == told, "a value came after the end of the watch");
    });
}

TEST_F(StoreSchedules, ACallbackThatWritesIsToldOfIt) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        bool hasWritten = false;
        watched.whenTold = [&] {
            if (!std::exchange(hasWritten, true)) watched.set(10);
        };
        together({[&] { watched.set(1); }, [&] { watched.set(2); }});
        requireEqual(watched.told.size(), 3U, "values");
    });
}

TEST_F(StoreSchedules, TheEndOfTheStoreBesideACancelTellsOnceAtMost) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        watched.publisher.reset();
        together({[&] { watched.store.reset(); }, [&] { watched.handle = SubscriptionHandle(); }});
        require(watched.completions <= 1, "the end was told twice");
    });
}

TEST_F(StoreSchedules, TheEndOfTheStoreBesideTheLastReferenceToAWatchTellsOnce) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        watched.watch();
        together({[&] { watched.store.reset(); }, [&] { watched.publisher.reset(); }});
        requireEqual(watched.completions, 1, "completions");
    });
}

TEST_F(StoreSchedules, TheEndOfTheStoreBesideARequestTellsOnce) {
    expectAlways([](const Together& together) {
        WatchedStore watched(reactive_streams::Demand::oneAtATime);
        watched.watch();
        auto own = watched.store;
        together({[&] { watched.store.reset(); },
                  [&] {
                      own->set("a", 1);
                      own.reset();
                  }});
        watched.publisher.reset();
        watched.requireTold(1);
        requireEqual(watched.completions, 1, "completions");
    });
}

TEST_F(StoreSchedules, TwoWatchesBeginAtTheSameTime) {
    expectAlways([](const Together& together) {
        WatchedStore watched;
        int other = 0;
        SubscriptionHandle second;
        together({[&] { watched.watch(); },
                  [&] {
                      second = reactive_streams::subscribe(*watched.store->watchOption("a"),
                                                           {[&](const ConfigurationValue& value) {
                                                               other = boost::get<int>(value);
                                                           }});
                  },
                  [&] { watched.set(1); }});
        watched.requireTold(1);
        requireEqual(other, 1, "told to the other one");
    });
}

}  // namespace
}  // namespace velkor::testing::schedule
