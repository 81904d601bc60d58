#include "http/detail/routes/ChangeHub.hpp"

#include <algorithm>
#include <exception>
#include <optional>
#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"

namespace velkor::http::detail {

using configuration::ConfigurationImpl;
using configuration::OptionChange;
using reactive_streams::SubscriptionHandle;

void ChangeHub::join(ConfigurationImpl& store, const Changes& changes) {
    const common::MutexLock turn(joining);
    std::optional<std::uint64_t> newWatch;
    {
        const common::MutexLock lock(mutex);
        auto more = std::make_shared<All>(*all);
        more->push_back(changes);
        all = std::move(more);
        if (!std::exchange(isWatching, true)) newWatch = ++number;
    }
    if (!newWatch) return;
    try {
        begin(store, *newWatch);
    } catch (...) {
        endAll(*newWatch);
        throw;
    }
}

void ChangeHub::begin(ConfigurationImpl& store, std::uint64_t watchNumber) {
    const std::weak_ptr<ChangeHub> hub = weak_from_this();
    const auto end = [hub, watchNumber] {
        if (const auto alive = hub.lock()) alive->endAll(watchNumber);
    };
    auto handle = reactive_streams::subscribe<OptionChange>(
        *store.watchChanges(""),
        {[hub, watchNumber](OptionChange&& change) {
             if (const auto alive = hub.lock()) alive->pass(watchNumber, std::move(change));
         },
         end, [end](const std::exception_ptr&) { end(); }},
        reactive_streams::Demand::oneAtATime);
    const common::MutexLock lock(mutex);
    // What was left or has ended meanwhile is given up, without the mutex. No other watch has
    // begun: only who joins begins one.
    if (isWatching) std::swap(watch, handle);
}

void ChangeHub::leave(const Changes& changes) {
    SubscriptionHandle done;
    const common::MutexLock lock(mutex);
    auto others = std::make_shared<All>(*all);
    others->erase(std::remove(others->begin(), others->end(), changes), others->end());
    if (others->empty() && std::exchange(isWatching, false)) std::swap(done, watch);
    all = std::move(others);
}

void ChangeHub::pass(std::uint64_t watchNumber, OptionChange&& change) {
    std::shared_ptr<const All> receivers;
    {
        const common::MutexLock lock(mutex);
        if (watchNumber != number) return;
        receivers = all;
    }
    try {
        const auto shared = std::make_shared<const OptionChange>(std::move(change));
        for (const Changes& each : *receivers) {
            if (!each->add(shared)) leave(each);
        }
    } catch (...) {
        endAll(watchNumber);  // they would miss the change
        throw;
    }
}

void ChangeHub::endAll(std::uint64_t watchNumber) {
    SubscriptionHandle done;
    std::shared_ptr<const All> ended = std::make_shared<const All>();
    {
        const common::MutexLock lock(mutex);
        if (watchNumber != number || !std::exchange(isWatching, false)) return;
        std::swap(done, watch);
        ended.swap(all);
    }
    for (const Changes& each : *ended) each->end();
}

}  // namespace velkor::http::detail
