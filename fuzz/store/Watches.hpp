#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "fuzz/store/System.hpp"

namespace velkor::fuzz::store {

/// The watches of a store, or of the model of one: publishers, as long as they are held, and the
/// last subscription to each.
template <class Publisher>
class Watches {
public:
    explicit Watches(System& itsSystem) : system(itsSystem) {}

    /// Begins a watch: `open` gives its publisher. The number of the watch is taken before, since
    /// what `open` calls may begin others.
    template <class Open>
    void begin(const Step& step, Open open) {
        const std::size_t number = watches.size();
        watches.emplace_back();
        const std::shared_ptr<Publisher> publisher = open();
        if (step.flag) watches[number].held = publisher;
        subscribe(*publisher, number, step);
    }

    /// Carries out a step on a watch: `b`, `q`, `x` or `v`.
    std::string carryOut(const Step& step) {
        if (watches.empty()) return "no watch";
        const std::size_t number = step.number % watches.size();
        if (step.operation == 'v') {
            const auto givenUp = std::move(watches[number].held);
            return "";
        }
        if (step.operation == 'b') {
            const auto publisher = watches[number].held;
            if (publisher) subscribe(*publisher, number, step);
            return "";
        }
        const auto subscription = watches[number].subscription.lock();
        if (subscription == nullptr) return "";
        if (step.operation == 'q') {
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
        publisher.subscribe(std::make_shared<Watcher>(
            system, number, step,
            [this, number](auto opened) { watches[number].subscription = std::move(opened); }));
    }

    System& system;
    std::vector<Watch> watches{};
};

}  // namespace velkor::fuzz::store
