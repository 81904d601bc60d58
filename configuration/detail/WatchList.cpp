#include "configuration/detail/WatchList.hpp"

#include <algorithm>
#include <iterator>
#include <new>
#include <utility>

#include "configuration/Loggers.hpp"
#include "configuration/detail/Lookup.hpp"
#include "configuration/detail/SubscriberErrors.hpp"

namespace velkor::configuration::detail {

namespace {

void tell(const WatchList::Publishers& watchers, const std::string& key,
          const ConfigurationValue& value) {
    for (const auto& publisher : watchers) {
        try {
            storeLogger.write(common::debug, "notifying watcher: ", key);
            publisher->publish(value);
        } catch (...) {
            reportSubscriberError("value", key);
        }
    }
}

}  // namespace

void WatchList::add(std::shared_ptr<WatchPublisher> publisher, const std::string& key,
                    std::uint64_t streamId) {
    entries.insert(entries.end(), PublisherEntry{std::move(publisher), key, streamId});
}

WatchList::Publishers WatchList::watching(const std::string& key) const {
    Publishers publishers;
    if (entries.empty()) return publishers;
    boost::container::small_vector<const PublisherEntry*, 4> found;
    const auto [first, last] = entries.get<ByKey>().equal_range(key);
    std::transform(first, last, std::back_inserter(found),
                   [](const auto& entry) { return &entry; });
    // The index keeps equal keys together, in no order of its own.
    std::sort(found.begin(), found.end(),
              [](const auto* left, const auto* right) { return left->streamId < right->streamId; });
    for (const auto* entry : found) publishers.push_back(entry->publisher);
    return publishers;
}

void WatchList::update(StoreLock::Level& level, SourceRegistry& sources,
                       const std::string& key) const {
    try {
        readAndTell(level, sources, key);
    } catch (const std::bad_alloc&) {
        // The change has been made: whoever makes it must not take it for one that has failed.
        reportSubscriberError("value", key);
    }
}

void WatchList::readAndTell(StoreLock::Level& level, SourceRegistry& sources,
                            const std::string& key) const {
    storeLogger.write(common::debug, "updatePublishers: ", key);
    // Reading a value for nobody is left out where neither the log nor a source would show it.
    const bool noticed = sources.hasAskedSources() || storeLogger.isEnabled(common::debug);
    Publishers watchers;
    if (!noticed) {
        watchers = watching(key);
        if (watchers.empty()) return;
    }
    ConfigurationValue value;
    {
        const Lookup layer(sources, key);
        if (!layer) return;
        value = layer.value();
    }
    // A source or a log sink may have added or cancelled watches meanwhile.
    if (noticed) watchers = watching(key);
    if (watchers.empty()) return;
    level.releasedWhile([&] {
        tell(watchers, key, value);
        // The last reference to a watch that was cancelled meanwhile is given up without the lock.
        watchers.clear();
    });
}

std::shared_ptr<WatchPublisher> WatchList::remove(std::uint64_t streamId) {
    return take(entries.find(streamId));
}

std::shared_ptr<WatchPublisher> WatchList::removeOldest() {
    return take(entries.begin());
}

std::shared_ptr<WatchPublisher> WatchList::take(Entries::iterator entry) {
    if (entry == entries.end()) return nullptr;
    auto publisher = entry->publisher;
    entries.erase(entry);
    return publisher;
}

}  // namespace velkor::configuration::detail
