#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "tests/stress/histories/Linearizability.hpp"
#include "tests/stress/histories/StoreModel.hpp"

namespace velkor::testing {

/// One call of a store, by one of the threads.
struct StoreRecord {
    Recorded<StoreCall> recorded;
    std::size_t thread = 0;
    std::optional<std::uint64_t> version{};  ///< That of a `read`.
};

/// What a subscriber was told, from when the call began until it ended.
struct Signal {
    enum class Kind { subscribed, value, completed, failed };

    Kind kind;
    std::string key{};                       ///< Of a value, with what `get` of it would answer,
    std::string text{};                      ///< or `getOption` if it is a change.
    std::optional<std::uint64_t> version{};  ///< Of a change.
    std::size_t thread = 0;
    std::uint64_t begun = 0;
    std::uint64_t ended = 0;
};

/// One watch from its beginning to the end of the store.
struct WatchLog {
    enum class Kind { values, changes };

    Kind kind;
    std::string watched;        ///< A key, or for changes what keys begin with.
    std::uint64_t opened = 0;   ///< Before the store was asked for it.
    bool fromTheStart = false;  ///< Opened and asked for all there will ever be before any call.
    std::uint64_t requested = 0;
    std::optional<std::uint64_t> cancelled{};  ///< When `cancel` had returned.
    std::vector<Signal> signals{};             ///< In the order in which they began.
};

/// Everything that was asked of a fresh store and told by it until its end. The last calls, with
/// all others done, are a `getOption` of every key.
struct StoreHistory {
    std::vector<StoreRecord> calls{};
    std::vector<WatchLog> watches{};

    /// For a history of single keys without registrations, in which each key has as many watchers
    /// of its values, all from the start: they must have been told of every write, inside of it,
    /// and the writes are in the order in which they were told.
    std::optional<std::size_t> watchersOfAKey{};
};

/// What a store must not have done in this history; empty when there is nothing. It must
/// - have answered as a `StoreModel` does to the same calls, one after the other in an order that
///   puts each between its beginning and its end, `read`s by their versions;
/// - have told watchers what `get` would have answered at a moment between the beginning of the
///   watch and the delivery, changes by their versions, each change beside no other of that watch;
/// - have told watchers from the start the value that is left in the end: those of changes as the
///   last of each key, those of values at least once (a key that a group begins excepted: nobody is
///   told when it goes with its source);
/// - have kept to the rules for subscribers: `onSubscribe` first and once, no more than was asked
///   for, `onComplete` once with the end of the store and as the last, nothing after a `cancel` but
///   by a call that had begun before.
std::string complaintOf(const StoreHistory& history);

}  // namespace velkor::testing
