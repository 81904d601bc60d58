#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "framework/reactive_streams/Subscriber.hpp"
#include "fuzz/store/System.hpp"

namespace velkor::fuzz::store {

/// The letters of the steps on one kind of watch.
struct WatchLetters {
    char subscribe;
    char request;
    char cancel;
    char giveUp;
};
constexpr WatchLetters ofValues{'b', 'q', 'x', 'v'};
constexpr WatchLetters ofChanges{'B', 'Q', 'X', 'V'};

/// What subscribes to watches, of a store and of a model.
template <class T>
class Watcher final : public reactive_streams::Subscriber<T> {
public:
    using Opened = std::function<void(std::weak_ptr<reactive_streams::Subscription>)>;

    /// Does what `watch` says. `keep` takes the subscription; `request` is the step that requests
    /// of it.
    Watcher(System& itsSystem, const Step& watch, const Step& itsRequest, Opened keep)
        : system(itsSystem), step(watch), request(itsRequest), onOpened(std::move(keep)) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> subscription) override {
        onOpened(std::move(subscription));
        note("subscribed");
        system.perform(request);
    }
    void onComplete() override { note("completed"); }
    void onError(const std::exception_ptr& /*error*/) override { note("failed"); }

    /// Notes the value, reacts, and throws if it is to.
    using reactive_streams::Subscriber<T>::onNext;
    void onNext(T&& value) override {
        note("gets " + spelledWatched(value));
        const bool throws = step.throws;
        if (step.reaction != nullptr && reactionsLeft > 0) {
            --reactionsLeft;
            // Which may be the end of this.
            const auto reaction = step.reaction;
            system.perform(*reaction);
        }
        if (throws) throw std::runtime_error("a subscriber");
    }

private:
    void note(const std::string& event) {
        system.note(std::string("watcher ") + request.operation + std::to_string(request.number) +
                    ' ' + event);
    }

    System& system;
    const Step step;
    const Step request;
    const Opened onOpened;
    int reactionsLeft = 3;
};

/// The watches of one kind that a store has, or the model of one: publishers, as long as they are
/// held, and the last subscription to each.
template <class Publisher, class T>
class Watches {
public:
    Watches(System& itsSystem, WatchLetters itsLetters) : system(itsSystem), letters(itsLetters) {}

    /// Begins a watch: `open` gives its publisher. The number of the watch is taken before, since
    /// what `open` calls may begin others.
    template <class Open>
    std::string begin(const Step& step, Open open) {
        const std::size_t number = watches.size();
        watches.emplace_back();
        const std::shared_ptr<Publisher> publisher = open();
        if (step.flag) watches[number].held = publisher;
        subscribe(*publisher, number, step);
        return "";
    }

    /// Whether `step` is one on a watch of this kind.
    bool isMeant(const Step& step) const noexcept {
        return step.operation == letters.subscribe || step.operation == letters.request ||
               step.operation == letters.cancel || step.operation == letters.giveUp;
    }

    /// Carries out a step on a watch.
    std::string carryOut(const Step& step) {
        if (watches.empty()) return "no watch";
        const std::size_t number = step.number % watches.size();
        if (step.operation == letters.giveUp) {
            const auto givenUp = std::move(watches[number].held);
            return "";
        }
        if (step.operation == letters.subscribe) {
            const auto publisher = watches[number].held;
            if (publisher) subscribe(*publisher, number, step);
            return "";
        }
        const auto subscription = watches[number].subscription.lock();
        if (subscription == nullptr) return "";
        if (step.operation == letters.request) {
            subscription->request(step.demand);
        } else {
            subscription->cancel();
        }
        return "";
    }

    /// Gives the publishers up in their order, those included that this brings about.
    void end() {
        for (std::size_t i = 0; i < watches.size(); ++i) watches[i].held.reset();
    }

private:
    struct Watch {
        std::shared_ptr<Publisher> held;
        std::weak_ptr<reactive_streams::Subscription> subscription;
    };

    void subscribe(Publisher& publisher, std::size_t number, const Step& step) {
        Step request;
        request.operation = letters.request;
        request.number = number;
        request.demand = step.demand;
        publisher.subscribe(std::make_shared<Watcher<T>>(
            system, step, request,
            [this, number](auto opened) { watches[number].subscription = std::move(opened); }));
    }

    System& system;
    const WatchLetters letters;
    std::vector<Watch> watches{};
};

}  // namespace velkor::fuzz::store
