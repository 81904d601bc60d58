#include "configuration/WatchList.hpp"

#include <algorithm>
#include <utility>

namespace velkor::configuration {

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

}  // namespace velkor::configuration
