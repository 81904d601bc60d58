// Stores with a fault each, of the kinds that a lost lock or a wrong order makes: the search for
// such faults must find every one of them.

#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "tests/stress/histories/StoreRound.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using configuration::OptionChange;
using reactive_streams::PublisherAPI;
using reactive_streams::Subscriber;
using reactive_streams::Subscription;
using Kind = StoreCall::Kind;

/// Every second `get` of a key answers what the one before did.
class StaleReads : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::get) return StoreSubject::perform(call);
        const Answer fresh = StoreSubject::perform(call);
        const std::lock_guard<std::mutex> lock(mutex);
        const auto kept = answers.find(call.key);
        if (kept == answers.end()) {
            answers.emplace(call.key, fresh);
            return fresh;
        }
        const Answer stale = kept->second;
        answers.erase(kept);
        return stale;
    }

private:
    std::mutex mutex;
    std::map<std::string, Answer> answers;  // guarded by mutex
};

/// What `set` replaces is read before, without a lock around both.
class UnlockedExchange : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::set || call.source) return StoreSubject::perform(call);
        StoreCall dryRun{Kind::dryRun};
        dryRun.changes = {{call.key, call.value}};
        const std::string before = StoreSubject::perform(dryRun).text;
        letOthersIn();  // in the place of the lock that is missing
        const Answer answer = StoreSubject::perform(call);
        const auto colon = before.rfind(':');
        if (before.rfind("Changes refused", 0) == 0) return answer;
        const std::string replaced = before.substr(colon + 1);
        return {replaced == "-" ? std::to_string(call.value) : replaced};
    }
};

/// Several changes are made one by one.
class TornChanges : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::apply) return StoreSubject::perform(call);
        StoreCall dryRun = call;
        dryRun.kind = Kind::dryRun;
        const Answer answer = StoreSubject::perform(dryRun);
        if (answer.text.rfind("Changes refused", 0) == 0) return answer;
        for (const auto& change : call.changes) {
            StoreCall one{Kind::apply};
            one.changes = {change};
            StoreSubject::perform(one);
            letOthersIn();  // in the place of the lock that is missing
        }
        return answer;
    }
};

/// A `set` returns before the value is there.
class LateWrites : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        std::optional<StoreCall> late;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            late.swap(postponed);
            if (call.kind == Kind::set) postponed = call;
        }
        if (late) StoreSubject::perform(*late);
        if (call.kind != Kind::set) return StoreSubject::perform(call);
        StoreCall dryRun{Kind::dryRun};
        dryRun.changes = {{call.key, call.value, call.source}};
        const std::string before = StoreSubject::perform(dryRun).text;
        if (before.rfind("Changes refused", 0) == 0) return StoreSubject::perform(call);
        const std::string replaced = before.substr(before.rfind(':') + 1);
        return {replaced == "-" ? std::to_string(call.value) : replaced};
    }

private:
    std::mutex mutex;
    std::optional<StoreCall> postponed;  // guarded by mutex
};

/// Whether there is such a source is found out before it is removed.
class RemovalTwice : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::remove) return StoreSubject::perform(call);
        const std::string all = StoreSubject::perform({Kind::describe}).text;
        const bool known = ("," + all).find("," + *call.source + "(") != std::string::npos;
        letOthersIn();  // in the place of the lock that is missing
        StoreSubject::perform(call);
        return {known ? "true" : "false"};
    }
};

/// A source is put in its place in two steps.
class RegistrationInTwoSteps : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::add) return StoreSubject::perform(call);
        StoreCall empty = call;
        empty.layer.values.clear();
        empty.layer.readOnly = false;
        const Answer answer = StoreSubject::perform(empty);
        if (answer.text != "true") return answer;
        letOthersIn();  // in the place of the lock that is missing
        StoreSubject::perform({Kind::remove, "", 0, call.layer.name});
        StoreSubject::perform(call);
        return answer;
    }
};

/// Several keys are read one by one.
class TornReadings : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::read) return StoreSubject::perform(call);
        Answer answer;
        for (const std::string& key : call.keys) {
            StoreCall one{Kind::read};
            one.keys = {key};
            const Answer part = StoreSubject::perform(one);
            answer.text += (answer.text.empty() ? "" : ",") + part.text;
            answer.version = part.version;
            letOthersIn();  // in the place of the lock that is missing
        }
        return answer;
    }
};

/// The version is another moment's.
class OldVersions : public StoreSubject {
public:
    Answer perform(const StoreCall& call) override {
        if (call.kind != Kind::read) return StoreSubject::perform(call);
        const auto before = StoreSubject::perform(call).version;
        letOthersIn();  // in the place of the lock that is missing
        return {StoreSubject::perform(call).text, before};
    }
};

/// Does as `Tampering` says with what a subscriber is told.
template <class T, class Tampering>
class TamperedSubscriber final : public Subscriber<T> {
public:
    using Subscriber<T>::onNext;

    explicit TamperedSubscriber(std::shared_ptr<Subscriber<T>> told) : target(std::move(told)) {}

    void onSubscribe(std::weak_ptr<Subscription> subscription) override {
        target->onSubscribe(std::move(subscription));
    }
    void onNext(T&& value) override { tampering.tell(*target, std::move(value)); }
    void onComplete() override { tampering.complete(*target); }
    void onError(const std::exception_ptr& error) override { target->onError(error); }

private:
    const std::shared_ptr<Subscriber<T>> target;
    Tampering tampering;
};

template <class T, class Tampering>
class TamperedPublisher final : public PublisherAPI<T> {
public:
    explicit TamperedPublisher(std::shared_ptr<PublisherAPI<T>> tampered)
        : original(std::move(tampered)) {}

    Future<bool> getCompletionFuture() override { return original->getCompletionFuture(); }
    void subscribe(std::shared_ptr<Subscriber<T>> subscriber) override {
        original->subscribe(
            std::make_shared<TamperedSubscriber<T, Tampering>>(std::move(subscriber)));
    }

private:
    const std::shared_ptr<PublisherAPI<T>> original;
};

template <template <class> class Tampering>
class TamperedWatches : public StoreSubject {
public:
    std::shared_ptr<PublisherAPI<ConfigurationValue>> watchOption(const std::string& key) override {
        return std::make_shared<
            TamperedPublisher<ConfigurationValue, Tampering<ConfigurationValue>>>(
            StoreSubject::watchOption(key));
    }
    std::shared_ptr<PublisherAPI<OptionChange>> watchChanges(const std::string& prefix) override {
        return std::make_shared<TamperedPublisher<OptionChange, Tampering<OptionChange>>>(
            StoreSubject::watchChanges(prefix));
    }
};

template <class T>
struct Faithful {
    void tell(Subscriber<T>& target, T&& value) { target.onNext(std::move(value)); }
    void complete(Subscriber<T>& target) { target.onComplete(); }
};

/// Every third value is lost.
template <class T>
struct Losing : Faithful<T> {
    void tell(Subscriber<T>& target, T&& value) {
        if (count++ % 3 != 2) target.onNext(std::move(value));
    }
    std::atomic<int> count{0};
};

/// Every value comes twice.
template <class T>
struct Repeating : Faithful<T> {
    void tell(Subscriber<T>& target, T&& value) {
        target.onNext(T(value));
        target.onNext(std::move(value));
    }
};

/// Every value comes after the one that came after it.
template <class T>
struct Turning : Faithful<T> {
    void tell(Subscriber<T>& target, T&& value) {
        std::optional<T> earlier;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            earlier.swap(kept);
            if (!earlier) kept.emplace(std::move(value));
        }
        if (!earlier) return;
        target.onNext(std::move(value));
        target.onNext(std::move(*earlier));
    }
    std::mutex mutex;
    std::optional<T> kept;  // guarded by mutex
};

/// The end comes twice.
template <class T>
struct EndingTwice : Faithful<T> {
    void complete(Subscriber<T>& target) {
        target.onComplete();
        target.onComplete();
    }
};

/// The end never comes.
template <class T>
struct Endless : Faithful<T> {
    void complete(Subscriber<T>&) {}
};

struct Broken {
    const char* name;
    std::function<std::unique_ptr<StoreSubject>()> make;
    bool everything = true;
};

template <class Subject>
std::unique_ptr<StoreSubject> make() {
    return std::make_unique<Subject>();
}

class BrokenStores : public ::testing::TestWithParam<Broken> {
protected:
    // Most take a single round, and those that need luck some tens.
    static constexpr unsigned mostRounds = 20'000;

    static bool isFoundIn(unsigned round) {
        const auto subject = GetParam().make();
        RoundPlan plan;
        plan.seed = round;
        plan.everything = GetParam().everything;
        return !StoreRound::complaintOf(*subject, plan).empty();
    }
};

TEST_P(BrokenStores, AreFoundOut) {
    unsigned round = 1;
    while (round < mostRounds && !isFoundIn(round)) ++round;
    EXPECT_LT(round, mostRounds);
    RecordProperty("rounds", static_cast<int>(round));
}

INSTANTIATE_TEST_SUITE_P(, BrokenStores,
                         ::testing::ValuesIn(std::vector<Broken>{
                             {"StaleReads", make<StaleReads>},
                             {"StaleReadsOfOneKey", make<StaleReads>, false},
                             {"UnlockedExchange", make<UnlockedExchange>},
                             {"UnlockedExchangeOfOneKey", make<UnlockedExchange>, false},
                             {"TornChanges", make<TornChanges>},
                             {"LateWrites", make<LateWrites>},
                             {"LateWritesOfOneKey", make<LateWrites>, false},
                             {"RemovalTwice", make<RemovalTwice>},
                             {"RegistrationInTwoSteps", make<RegistrationInTwoSteps>},
                             {"TornReadings", make<TornReadings>},
                             {"OldVersions", make<OldVersions>},
                             {"LosingWatches", make<TamperedWatches<Losing>>},
                             {"LosingWatchesOfOneKey", make<TamperedWatches<Losing>>, false},
                             {"RepeatingWatches", make<TamperedWatches<Repeating>>},
                             {"RepeatingWatchesOfOneKey", make<TamperedWatches<Repeating>>, false},
                             {"TurningWatches", make<TamperedWatches<Turning>>},
                             {"TurningWatchesOfOneKey", make<TamperedWatches<Turning>>, false},
                             {"WatchesThatEndTwice", make<TamperedWatches<EndingTwice>>},
                             {"EndlessWatches", make<TamperedWatches<Endless>>},
                         }),
                         [](const auto& broken) { return broken.param.name; });

}  // namespace
}  // namespace velkor::testing
