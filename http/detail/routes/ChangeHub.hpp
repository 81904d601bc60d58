#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"
#include "http/detail/routes/PendingChanges.hpp"

namespace velkor::http::detail {

/// Takes the changes of a store once for all clients that are shown them: the store, and whoever
/// writes it, does the same work whether there is one or a thousand. The store is watched as long
/// as there are any. Thread-safe; calls nobody under `mutex`.
class ChangeHub : public std::enable_shared_from_this<ChangeHub> {
public:
    using Changes = std::shared_ptr<PendingChanges>;

    ChangeHub() = default;
    ChangeHub(const ChangeHub&) = delete;
    ChangeHub& operator=(const ChangeHub&) = delete;

    /// Passes what changes in `store` from now on to `changes`, until these are over or `leave`.
    /// Waits for a watch that is being begun, which waits for the store: what the store calls must
    /// not join.
    void join(configuration::ConfigurationImpl& store, const Changes& changes)
        VELKOR_EXCLUDES(joining, mutex);

    /// Takes `changes` out again; ends the watch with the last ones, for which it waits for the
    /// store.
    void leave(const Changes& changes) VELKOR_EXCLUDES(mutex);

private:
    using All = std::vector<Changes>;

    void begin(configuration::ConfigurationImpl& store, std::uint64_t watchNumber)
        VELKOR_REQUIRES(joining) VELKOR_EXCLUDES(mutex);
    void pass(std::uint64_t watchNumber, configuration::OptionChange&& change)
        VELKOR_EXCLUDES(mutex);
    void endAll(std::uint64_t watchNumber) VELKOR_EXCLUDES(mutex);

    // Held while a watch is begun: who joins meanwhile would miss what changes before it is there.
    // Taken before `mutex`, by `join` only.
    common::Mutex joining;
    common::Mutex mutex;
    // Replaced, never changed: whoever passes a change on does so without the mutex.
    std::shared_ptr<const All> all VELKOR_GUARDED_BY(mutex) = std::make_shared<const All>();
    reactive_streams::SubscriptionHandle watch VELKOR_GUARDED_BY(mutex);
    // Of the watch; what an older one still delivers is not passed on.
    std::uint64_t number VELKOR_GUARDED_BY(mutex) = 0;
    bool isWatching VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::http::detail
