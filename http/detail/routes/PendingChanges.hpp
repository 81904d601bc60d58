#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "configuration/Changes.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/detail/StreamQueue.hpp"

namespace velkor::http::detail {

/// A change that several streams share.
using SharedChange = std::shared_ptr<const configuration::OptionChange>;

/// The changes that one client has not been shown yet, the newest of each key, the key that has
/// waited longest first. One thread takes, any other adds. A client that is too slow for the number
/// of its keys is given up: what is kept for it is bounded. Calls nobody under its mutex.
class PendingChanges {
public:
    /// Keeps changes of the keys that `keyPrefix` begins, of at most `most` keys.
    PendingChanges(std::string keyPrefix, std::size_t most);

    /// Lets `whenReady` be called, from any thread, when there is something to take, or the stream
    /// is over, after `take` gave nothing; and now if there is.
    void start(std::function<void()> whenReady) VELKOR_EXCLUDES(mutex);

    /// Adds a change, unless the stream is over or the key isn't one of its. Gives false once it is
    /// over, also because of this change.
    bool add(const SharedChange& change) VELKOR_EXCLUDES(mutex);

    /// Ends the stream; what is kept can still be taken.
    void end() VELKOR_EXCLUDES(mutex);

    /// Ends the stream, and tells nobody: who would take has gone.
    void abandon() VELKOR_EXCLUDES(mutex);

    /// The change that is next; null when there is none.
    SharedChange take() VELKOR_EXCLUDES(mutex);

    /// Whether the stream has ended and everything was taken.
    bool isOver() const VELKOR_EXCLUDES(mutex);

    /// How many changes were replaced before they were taken, since the last call.
    std::uint64_t takeConflated() VELKOR_EXCLUDES(mutex);

private:
    struct KeyOf {
        const std::string& operator()(const SharedChange& change) const { return change->key; }
    };
    using Queue = velkor::detail::NewestByKey<SharedChange, KeyOf>;

    void wake() VELKOR_EXCLUDES(mutex);

    const std::string prefix;
    const std::size_t mostKeys;
    mutable common::Mutex mutex;
    Queue queue VELKOR_GUARDED_BY(mutex);
    std::size_t count VELKOR_GUARDED_BY(mutex) = 0;
    std::uint64_t conflated VELKOR_GUARDED_BY(mutex) = 0;
    std::shared_ptr<const std::function<void()>> onReady VELKOR_GUARDED_BY(mutex);
    bool isAwaited VELKOR_GUARDED_BY(mutex) = true;
    bool isEnded VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::http::detail
