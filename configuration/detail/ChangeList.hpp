#pragma once

#include <boost/container/small_vector.hpp>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/detail/SourceRegistry.hpp"
#include "framework/reactive_streams/ConflatingPublisher.hpp"

namespace velkor::configuration::detail {

/// The key that changes are kept by.
struct KeyOfChange {
    const std::string& operator()(const OptionChange& change) const noexcept { return change.key; }
};

/// The stream of changes behind one `watchChanges`.
using ChangePublisher =
    reactive_streams::ConflatingPublisher<OptionChange, KeyOfChange, std::function<void()>>;

/// The store's streams of changes. Not thread-safe: guarded by the store's mutex. Owns a reference
/// to each publisher.
class ChangeList {
    struct Entry;

public:
    /// Streams that have something to deliver, or have failed. To be served without the mutex.
    class Due {
    public:
        bool empty() const noexcept { return streams.empty(); }

        /// Delivers what is kept. What escapes from a subscriber is reported on standard error as
        /// "Error in configuration change subscriber: " and the prefix; the others are served.
        void serve();

    private:
        friend class ChangeList;

        struct Stream {
            std::shared_ptr<ChangePublisher> publisher;
            std::string prefix;
            std::exception_ptr failure;  ///< What kept a change from being kept.
        };

        void note(const Entry& entry) noexcept;

        boost::container::small_vector<Stream, 2> streams;
    };

    /// Adds the stream numbered `streamId`, which is to be told of the keys that `prefix` begins.
    void add(std::shared_ptr<ChangePublisher> publisher, const std::string& prefix,
             std::uint64_t streamId);

    bool empty() const noexcept { return entries.empty(); }

    /// Keeps what `sources` hold for `key` now in each stream that is to be told of it, as of
    /// `version`, and notes these streams in `due`. A stream that can't keep it, since a source
    /// throws or memory is short, fails when it is served: none goes on with a change missing. One
    /// that can't be noted for want of memory is served with its next change, and so is one that
    /// has failed while there is none at all.
    void keep(SourceRegistry& sources, const std::string& key, std::uint64_t version, Due& due);

    /// A change is missing in every stream: each fails with its next change, for `reason`.
    void failAll(const std::exception_ptr& reason) noexcept;

    /// Removes a stream and gives the list's reference back; null when there is none.
    std::shared_ptr<ChangePublisher> remove(std::uint64_t streamId);

    /// Removes the oldest stream and gives the list's reference back; null when there is none.
    std::shared_ptr<ChangePublisher> removeOldest();

private:
    struct Entry {
        std::shared_ptr<ChangePublisher> publisher;
        std::string prefix;
        std::uint64_t streamId;
        std::exception_ptr failure;  // what keeps it from going on, once there is something
    };

    std::shared_ptr<ChangePublisher> take(std::vector<Entry>::iterator entry);

    std::vector<Entry> entries;  // in order of creation
};

}  // namespace velkor::configuration::detail
