#pragma once

#include <boost/container/small_vector.hpp>
#include <boost/multi_index/hashed_index.hpp>
#include <boost/multi_index/indexed_by.hpp>
#include <boost/multi_index/member.hpp>
#include <boost/multi_index/ordered_index.hpp>
#include <boost/multi_index_container.hpp>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/detail/SourceRegistry.hpp"
#include "configuration/detail/StoreLock.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"

namespace velkor::configuration::detail {

/// The stream behind one watch.
using WatchPublisher =
    reactive_streams::CachedValuePublisher<ConfigurationValue, std::function<void()>>;

/// The store's watches in order of creation, found by key without a look at the others.
/// Not thread-safe: guarded by the store's mutex. Owns a reference to each publisher.
class WatchList {
public:
    /// The publishers of one key; a few fit without an allocation.
    using Publishers = boost::container::small_vector<std::shared_ptr<WatchPublisher>, 4>;

    /// Adds the watch numbered `streamId`, which is higher than every one before it.
    void add(std::shared_ptr<WatchPublisher> publisher, const std::string& key,
             std::uint64_t streamId);

    bool empty() const { return entries.empty(); }

    /// The publishers that watch exactly `key`, in order of creation.
    Publishers watching(const std::string& key) const;

    /// Publishes the value of `key` in `sources`, if there is one, to the watchers of exactly that
    /// key, with `level` released. What escapes from one is reported on standard error as "Error in
    /// configuration value subscriber: " and the key, and so is, once, that there is no memory to
    /// read the value. What else a source or a log sink throws passes on, and so does
    /// `std::system_error` of `level`.
    void update(StoreLock::Level& level, SourceRegistry& sources, const std::string& key) const;

    /// Removes a watch and gives the list's reference back; null when there is none.
    std::shared_ptr<WatchPublisher> remove(std::uint64_t streamId);

    /// Removes the oldest watch and gives the list's reference back; null when the list is empty.
    std::shared_ptr<WatchPublisher> removeOldest();

private:
    struct PublisherEntry {
        std::shared_ptr<WatchPublisher> publisher;
        std::string key;
        std::uint64_t streamId;
    };

    struct ByStreamId;
    struct ByKey;

    using Entries = boost::multi_index_container<
        PublisherEntry,
        boost::multi_index::indexed_by<
            boost::multi_index::ordered_unique<
                boost::multi_index::tag<ByStreamId>,
                boost::multi_index::member<PublisherEntry, std::uint64_t,
                                           &PublisherEntry::streamId>>,
            boost::multi_index::hashed_non_unique<
                boost::multi_index::tag<ByKey>,
                boost::multi_index::member<PublisherEntry, std::string, &PublisherEntry::key>,
                std::hash<std::string>>>>;

    void readAndTell(StoreLock::Level& level, SourceRegistry& sources,
                     const std::string& key) const;
    std::shared_ptr<WatchPublisher> take(Entries::iterator entry);

    Entries entries;
};

}  // namespace velkor::configuration::detail
