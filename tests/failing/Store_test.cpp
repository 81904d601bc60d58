// The store, each of whose operations meets a want of memory, and what its sources, its watchers
// and standard error throw.

#include <algorithm>
#include <functional>
#include <limits>
#include <mutex>

#include "framework/common/TextConversion.hpp"
#include "tests/failing/StoreScene.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {
namespace {

using configuration::AppliedChange;
using configuration::Change;
using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::Option;
using configuration::ValueMap;

// ---- Reading

/// Runs `read` of a scene and, when it got through, expects what it has read to be right.
template <class Read>
void tryReading(Trial& trial, Read read) {
    StoreScene scene;
    bool isRight = false;
    if (trial.passes([&] { isRight = read(scene); })) {
        EXPECT_TRUE(isRight);
    }
    scene.expectAlive();
}

void getNear(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->get(s.near).get() == s.oldValue; });
}

void getFar(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->get(s.far).get() == s.oldValue; });
}

/// Whether `future` says in words that it can't.
template <class T>
bool isRefused(Future<T> future) {
    try {
        future.get();
    } catch (const ForeignFailure&) {
        throw;
    } catch (const std::logic_error&) {
        return true;
    } catch (const std::runtime_error&) {
        return true;
    }
    return false;
}

void getMissing(Trial& trial) {
    tryReading(trial, [](auto& s) { return isRefused(s.store->get(s.missing)); });
}

void getOption(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->getOption(s.far).get().source == "foreign"; });
}

void getMissingOption(Trial& trial) {
    tryReading(trial, [](auto& s) { return isRefused(s.store->getOption(s.missing)); });
}

void has(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->has(s.far).get(); });
}

void keys(Trial& trial) {
    tryReading(trial, [](auto& s) {
        return s.store->keys().get() == std::set<std::string>{s.near, s.far};
    });
}

void keysFrom(Trial& trial) {
    tryReading(trial, [](auto& s) {
        return s.store->keysFrom("", 2).get() == std::vector<std::string>{s.far, s.near};
    });
}

void explain(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->explain(s.far).get().size() == 1; });
}

void readSeveral(Trial& trial) {
    tryReading(trial, [](auto& s) {
        const auto reading = s.store->read({s.near, s.far, s.missing}).get();
        return reading.options.size() == 3 && reading.options[1] && !reading.options[2];
    });
}

void describeSources(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->describeSources().get().size() == 3; });
}

void findSource(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->findSource("foreign").get() == s.source; });
}

void getPtr(Trial& trial) {
    tryReading(trial, [](auto& s) { return s.store->getPtr() == s.store; });
}

void addEnvironmentSource(Trial& trial) {
    tryReading(trial, [](auto& s) { return !s.store->addEnvironmentSource("name", "", 1).get(); });
}

// ---- Writing one key

/// What is expected of a write of `key`, which held `before` and is to hold `after`. Whoever
/// watches it is told, or standard error; a write that has failed for want of memory has changed
/// nothing. What foreign code throws leaves the call even when the change has been made.
template <class Write>
void tryWriting(Trial& trial, StoreScene& scene, const std::string& key, const std::string& before,
                const std::string& after, const Watched<ConfigurationValue>* watch, Write write) {
    const int changesBefore = scene.changes.subscriber->values;
    const bool passed = trial.passes(write);
    const std::string now = scene.textIn(key);
    if (passed || trial.isOfMemory()) {
        EXPECT_EQ(now, passed ? after : before);
    } else {
        EXPECT_TRUE(now == before || now == after) << now;
    }
    if (passed) {
        if (watch != nullptr && !after.empty()) {
            scene.expectTold(*watch);
        }
    }
    const bool isTold = scene.changes.subscriber->values > changesBefore;
    // A stream that has a gap fails at once, or with its next change while there is no memory at
    // all.
    if (passed && !isTold && !(trial.isOfMemory() && trial.isLasting())) {
        EXPECT_TRUE(scene.standardError.lines > 0 || scene.changes.subscriber->errors == 1);
    }
    scene.expectAlive();
    // A stream never goes on with a change missing.
    if (now == after && !isTold) {
        EXPECT_EQ(scene.changes.subscriber->errors, 1);
    }
}

void overwriteNear(Trial& trial) {
    StoreScene s;
    tryWriting(trial, s, s.near, textOf(s.oldValue), textOf(s.newValue), &s.nearWatch,
               [&] { EXPECT_TRUE(s.store->set(s.near, s.newValue).get() == s.oldValue); });
}

void overwriteBelowALongPrefix(Trial& trial) {
    StoreScene s;
    Watched<configuration::OptionChange> changes;
    changes.open(s.store->watchChanges(s.near));
    trial.passes([&] { s.store->set(s.near, s.newValue).get(); });
    // What the stream has kept and not been told of comes with the next change.
    const int before = changes.subscriber->values;
    s.expectAlive();
    EXPECT_TRUE(changes.subscriber->values > before || changes.subscriber->errors == 1);
}

void setNewNear(Trial& trial) {
    StoreScene s;
    tryWriting(trial, s, s.missing, "", textOf(s.newValue), nullptr,
               [&] { EXPECT_TRUE(s.store->set(s.missing, s.newValue).get() == s.newValue); });
}

void overwriteFar(Trial& trial) {
    StoreScene s;
    tryWriting(trial, s, s.far, textOf(s.oldValue), textOf(s.newValue), &s.farWatch,
               [&] { s.store->set(s.far, s.newValue, "foreign").get(); });
}

void setNewFar(Trial& trial) {
    StoreScene s;
    const std::string key = "far." + s.missing;
    tryWriting(trial, s, key, "", textOf(s.newValue), nullptr,
               [&] { s.store->set(key, s.newValue, "foreign").get(); });
}

void setWhatCantBeWritten(Trial& trial) {
    tryReading(trial, [](auto& s) {
        return isRefused(s.store->set(s.near, s.newValue, longText("nowhere")));
    });
}

void unsetNear(Trial& trial) {
    StoreScene s;
    tryWriting(trial, s, s.near, textOf(s.oldValue), "", &s.nearWatch,
               [&] { EXPECT_TRUE(s.store->unset(s.near).get()); });
}

void unsetFar(Trial& trial) {
    StoreScene s;
    tryWriting(trial, s, s.far, textOf(s.oldValue), "", &s.farWatch,
               [&] { EXPECT_TRUE(s.store->unset(s.far, "foreign").get()); });
}

void unsetMissing(Trial& trial) {
    tryReading(trial, [](auto& s) { return !s.store->unset(s.missing).get(); });
}

// ---- Several keys

std::vector<Change> mixedChanges(const StoreScene& s) {
    return {{s.near, s.newValue},
            {s.missing, s.newValue},
            {s.far, s.newValue, "foreign"},
            {"far." + s.missing, s.newValue, "foreign"}};
}

std::string stateOf(const StoreScene& s) {
    return s.textIn(s.near) + "|" + s.textIn(s.far) + "|" + s.textIn(s.missing) + "|" +
           s.textIn("far." + s.missing);
}

/// What an `apply` that has thrown leaves behind: for want of memory, what was there before.
/// Otherwise perhaps all changes; in a source that always throws perhaps some.
void expectAllOrNothing(const Trial& trial, const StoreScene& s, const std::string& before,
                        const std::vector<Change>& changes) {
    if (!trial.isOfMemory() && trial.isLasting()) return;
    const bool isMade = s.textIn(changes.front().key) == textOf(*changes.front().value);
    if (trial.isOfMemory() || !isMade) {
        EXPECT_EQ(stateOf(s), before);
        return;
    }
    for (const auto& change : changes) {
        EXPECT_EQ(s.textIn(change.key), textOf(*change.value));
    }
}

void applyChanges(Trial& trial) {
    StoreScene s;
    const auto changes = mixedChanges(s);
    const std::string before = stateOf(s);
    const int told = s.changes.subscriber->values;
    const bool passed = trial.passes([&] { EXPECT_EQ(s.store->apply(changes).get().size(), 4U); });
    if (passed) {
        for (const auto& change : changes) {
            EXPECT_EQ(s.textIn(change.key), textOf(*change.value));
        }
        s.expectTold(s.nearWatch);
        s.expectTold(s.farWatch);
        if (trial.isOfMemory() && !trial.isLasting()) {
            EXPECT_TRUE(s.changes.subscriber->values == told + 4 ||
                        s.changes.subscriber->errors == 1);
        }
    } else {
        expectAllOrNothing(trial, s, before, changes);
    }
    s.expectAlive();
}

void applyForgetting(Trial& trial) {
    StoreScene s;
    const std::vector<Change> changes{{s.near}, {s.far, std::nullopt, "foreign"}};
    const std::string before = stateOf(s);
    const bool passed = trial.passes([&] { s.store->apply(changes).get(); });
    // A table that has given up the memory of a key can't have it back while none is left.
    if (passed || !trial.isLasting()) {
        const std::string now = stateOf(s);
        EXPECT_TRUE(now == (passed ? "|||" : before) || (!trial.isOfMemory() && now == "|||"))
            << now;
    }
    s.expectAlive();
}

void applyDry(Trial& trial) {
    tryReading(trial, [](auto& s) {
        const std::string before = s.textIn(s.near);
        return s.store->apply(mixedChanges(s), true).get().size() == 4;
    });
}

void applyRefused(Trial& trial) {
    tryReading(trial, [](auto& s) {
        return isRefused(s.store->apply({{s.near, s.newValue}, {s.near, s.newValue, "nowhere"}}));
    });
}

// ---- The registry

/// What is expected of a registration: it is made or not; what it takes can be registered after it.
template <class Add>
void tryAdding(Trial& trial, Add add) {
    StoreScene s;
    const bool passed = trial.passes([&] { EXPECT_TRUE(add(s)); });
    const auto present = s.store->findSource("added").get() != nullptr;
    if (passed) {
        EXPECT_TRUE(present);
        EXPECT_TRUE(s.store->has("more." + s.near).get());
    }
    s.expectAlive();
    EXPECT_EQ(s.store->removeSource("added").get(), present);
    EXPECT_FALSE(s.store->has("more." + s.near).get());
    EXPECT_TRUE(add(s));
}

void addInMemorySource(Trial& trial) {
    tryAdding(trial, [](auto& s) {
        return s.store->addInMemorySource("added", "more", 5, false, ValueMap{{s.near, 1}}).get();
    });
}

void addForeignSource(Trial& trial) {
    tryAdding(trial, [](auto& s) {
        return s.store
            ->addSource("added", "more", 5, false,
                        std::make_shared<ForeignSource>(
                            std::map<std::string, ConfigurationValue>{{s.near, 1}}))
            .get();
    });
}

void addPropertyFileSource(Trial& trial) {
    static const TemporaryFile file(longText("near") + " = 1\n");
    const std::u16string path = common::TextConversion("UTF-8").toUtf16(file.path().string());
    tryAdding(trial, [&](auto& s) {
        return s.store->addPropertyFileSource("added", "more", 5, true, path).get();
    });
}

// Watchers are told of what a source in front of theirs says.
void addInFront(Trial& trial) {
    StoreScene s;
    const bool passed = trial.passes([&] {
        s.store->addInMemorySource("front", "", -1, true, ValueMap{{s.near, s.newValue}});
    });
    if (passed) {
        s.expectTold(s.nearWatch);
        EXPECT_EQ(s.textIn(s.near), textOf(s.newValue));
    }
    s.store->removeSource("front");
    EXPECT_EQ(s.textIn(s.near), textOf(s.oldValue));
    s.expectAlive();
}

void addTwice(Trial& trial) {
    tryReading(trial, [](auto& s) {
        return isRefused(s.store->addInMemorySource("foreign", "", 5, false, {}));
    });
}

void removeInFront(Trial& trial) {
    StoreScene s;
    s.store->addInMemorySource("front", "", -1, true, ValueMap{{s.near, s.newValue}});
    s.nearWatch.subscriber->values = 0;
    const bool passed = trial.passes([&] { EXPECT_TRUE(s.store->removeSource("front").get()); });
    if (passed) {
        s.expectTold(s.nearWatch);
        EXPECT_EQ(s.textIn(s.near), textOf(s.oldValue));
    }
    s.store->removeSource("front");
    s.expectAlive();
}

void removeForeign(Trial& trial) {
    StoreScene s;
    const bool passed = trial.passes([&] { EXPECT_TRUE(s.store->removeSource("foreign").get()); });
    const bool present = s.store->findSource("foreign").get() != nullptr;
    if (passed) {
        EXPECT_FALSE(present);
    }
    // It is attached and told as long as it is there.
    EXPECT_EQ(s.source->host.expired(), !present);
    if (!present) s.store->addSource("foreign", "far.", 10, false, s.source);
    s.expectAlive();
}

void removeMissing(Trial& trial) {
    tryReading(trial, [](auto& s) { return !s.store->removeSource(s.missing).get(); });
}

// ---- Watching

template <class Open>
void tryWatching(Trial& trial, const std::string& key, int firstValues, Open open) {
    StoreScene s;
    auto watch = open(s);
    const auto begin = [&] { watch.open(s.store->watchOption(key)); };
    const bool passed = trial.passes(begin);
    const int told = watch.subscriber->values;
    if (passed) {
        EXPECT_EQ(told, firstValues);
    }
    // What the subscriber itself has thrown does not end the watch.
    const bool isWatching = watch.stream != nullptr && !watch.subscriber->subscription.expired();
    s.store->set(key, s.newValue);
    EXPECT_EQ(watch.subscriber->values, told + (isWatching ? 1 : 0));
    s.expectAlive();
}

Watched<ConfigurationValue> newWatch(StoreScene&) {
    return {};
}

void watchNear(Trial& trial) {
    tryWatching(trial, longText("near"), 1, newWatch);
}

void watchFar(Trial& trial) {
    tryWatching(trial, "far." + longText("key"), 1, newWatch);
}

void watchMissing(Trial& trial) {
    tryWatching(trial, longText("missing"), 0, newWatch);
}

void watchChanges(Trial& trial) {
    StoreScene s;
    Watched<configuration::OptionChange> watch;
    trial.passes([&] { watch.open(s.store->watchChanges(longText("near"))); });
    const bool isWatching = watch.stream != nullptr && !watch.subscriber->subscription.expired();
    s.store->set(s.near, s.newValue);
    EXPECT_EQ(watch.subscriber->values, isWatching ? 1 : 0);
    s.expectAlive();
}

void cancelAWatch(Trial& trial) {
    StoreScene s;
    Watched<ConfigurationValue> watch;
    watch.open(s.store->watchOption(s.near));
    EXPECT_TRUE(trial.passes([&] { watch.subscriber->subscription.lock()->cancel(); }));
    EXPECT_EQ(watch.stream.use_count(), 1);
    watch.subscriber->values = 0;
    s.expectAlive();
    EXPECT_EQ(watch.subscriber->values, 0);
}

void cancelChanges(Trial& trial) {
    StoreScene s;
    Watched<configuration::OptionChange> watch;
    watch.open(s.store->watchChanges(""));
    EXPECT_TRUE(trial.passes([&] { watch.subscriber->subscription.lock()->cancel(); }));
    EXPECT_EQ(watch.stream.use_count(), 1);
    s.expectAlive();
    EXPECT_EQ(watch.subscriber->values, 0);
}

void requestKeptChanges(Trial& trial) {
    StoreScene s;
    Watched<configuration::OptionChange> watch;
    watch.subscriber = std::make_shared<ForeignSubscriber<configuration::OptionChange>>(0);
    watch.open(s.store->watchChanges(""));
    s.store->set(s.near, s.newValue);
    s.store->set(s.far, s.newValue);
    const auto request = [&] { watch.subscriber->subscription.lock()->request(2); };
    trial.passes(request);
    request();
    EXPECT_EQ(watch.subscriber->values, 2);
    s.expectAlive();
}

// ---- What sources do by themselves

void changeBySource(Trial& trial) {
    StoreScene s;
    const bool passed = trial.passes([&] { s.source->change(s.farKey, s.newValue); });
    if (passed) {
        EXPECT_EQ(s.textIn(s.far), textOf(s.newValue));
        s.expectTold(s.farWatch);
    }
    s.expectAlive();
}

void changeTogether(Trial& trial) {
    StoreScene s;
    const auto change = [&] {
        s.source->change(s.farKey, s.newValue);
        s.source->change(s.missing, s.newValue);
        foreignCall();
    };
    const bool passed = trial.passes([&] { s.source->host.lock()->changeTogether(change); });
    if (passed) {
        s.expectTold(s.farWatch);
    }
    s.expectAlive();
}

// ---- The store itself

void makeAStore(Trial& trial) {
    std::shared_ptr<ConfigurationImpl> store;
    const bool passed = trial.passes([&] { store = std::make_shared<ConfigurationImpl>(); });
    EXPECT_EQ(store != nullptr, passed);
    if (passed) {
        EXPECT_EQ(store->describeSources().get().size(), 2U);
    }
}

void destroyAStore(Trial& trial) {
    StoreScene s;
    s.nearWatch.stream = s.farWatch.stream = nullptr;
    s.changes.stream = nullptr;
    EXPECT_TRUE(trial.passes([&] { s.store.reset(); }));
    EXPECT_EQ(s.nearWatch.subscriber->completions, 1);
    EXPECT_EQ(s.farWatch.subscriber->completions, 1);
    EXPECT_EQ(s.changes.subscriber->completions, 1);
    EXPECT_TRUE(s.source->host.expired());
    EXPECT_EQ(s.source->listener, nullptr);
}

/// A store that offers what its base protects.
class DerivedStore final : public ConfigurationImpl {
public:
    template <class Use>
    auto locked(Use use) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return use(lock);
    }
    using ConfigurationImpl::doGet;
    using ConfigurationImpl::doGetOption;
    using ConfigurationImpl::doHas;
    using ConfigurationImpl::updatePublishers;
};

template <class Use>
void tryDerived(Trial& trial, Use use) {
    ForeignStandardError standardError;
    const auto store = std::make_shared<DerivedStore>();
    const std::string key = "far." + longText("key");
    store->addSource("foreign", "far.", 1, false,
                     std::make_shared<ForeignSource>(std::map<std::string, ConfigurationValue>{
                         {longText("key"), longText("old")}}));
    Watched<ConfigurationValue> watch;
    watch.open(store->watchOption(key));
    trial.passes([&] {
        store->locked([&](auto& lock) {
            use(*store, lock, key);
            EXPECT_TRUE(lock.owns_lock());
            return true;
        });
    });
    onAnotherThread([&] { EXPECT_TRUE(store->findSource("foreign").get()); });
    const int before = watch.subscriber->values;
    store->set(key, 1, "foreign");
    EXPECT_EQ(watch.subscriber->values, before + 1);
}

void derivedReads(Trial& trial) {
    tryDerived(trial, [](auto& store, auto& lock, const auto& key) {
        EXPECT_TRUE(store.doHas(lock, key));
        EXPECT_TRUE(store.doGet(lock, key) == ConfigurationValue(longText("old")));
        EXPECT_EQ(store.doGetOption(lock, key).source, "foreign");
    });
}

void derivedUpdate(Trial& trial) {
    tryDerived(trial,
               [](auto& store, auto& lock, const auto& key) { store.updatePublishers(lock, key); });
}

constexpr Row reading[] = {
    {"Get", getNear},
    {"GetForeign", getFar},
    {"GetMissing", getMissing},
    {"GetOption", getOption},
    {"GetMissingOption", getMissingOption},
    {"Has", has},
    {"Keys", keys},
    {"KeysFrom", keysFrom},
    {"Explain", explain},
    {"Read", readSeveral},
    {"DescribeSources", describeSources},
    {"FindSource", findSource},
    {"GetPtr", getPtr},
    {"AddEnvironmentSource", addEnvironmentSource},
    {"Derived", derivedReads},
};
VELKOR_FAILING_ROWS(FailingReads, reading);

constexpr Row writing[] = {
    {"Overwrite", overwriteNear},
    {"OverwriteBelowALongPrefix", overwriteBelowALongPrefix},
    {"SetNew", setNewNear},
    {"OverwriteForeign", overwriteFar},
    {"SetNewForeign", setNewFar},
    {"SetRefused", setWhatCantBeWritten},
    {"Unset", unsetNear},
    {"UnsetForeign", unsetFar},
    {"UnsetMissing", unsetMissing},
    {"Apply", applyChanges},
    {"ApplyForgetting", applyForgetting},
    {"ApplyDry", applyDry},
    {"ApplyRefused", applyRefused},
    {"ChangeBySource", changeBySource},
    {"ChangeTogether", changeTogether},
    {"DerivedUpdate", derivedUpdate},
};
VELKOR_FAILING_ROWS(FailingWrites, writing);

constexpr Row registering[] = {
    {"MakeAStore", makeAStore},
    {"DestroyAStore", destroyAStore},
    {"AddInMemorySource", addInMemorySource},
    {"AddForeignSource", addForeignSource},
    {"AddPropertyFileSource", addPropertyFileSource},
    {"AddInFront", addInFront},
    {"AddTwice", addTwice},
    {"RemoveInFront", removeInFront},
    {"RemoveForeign", removeForeign},
    {"RemoveMissing", removeMissing},
};
VELKOR_FAILING_ROWS(FailingRegistrations, registering);

constexpr Row watching[] = {
    {"Watch", watchNear},
    {"WatchForeign", watchFar},
    {"WatchMissing", watchMissing},
    {"WatchChanges", watchChanges},
    {"CancelAWatch", cancelAWatch},
    {"CancelChanges", cancelChanges},
    {"RequestKeptChanges", requestKeptChanges},
};
VELKOR_FAILING_ROWS(FailingWatches, watching);

}  // namespace
}  // namespace velkor::testing
