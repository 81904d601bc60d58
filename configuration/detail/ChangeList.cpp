#include "configuration/detail/ChangeList.hpp"

#include <algorithm>
#include <iostream>
#include <utility>

namespace velkor::configuration::detail {

namespace {

bool begins(const std::string& prefix, const std::string& key) {
    return key.compare(0, prefix.size(), prefix) == 0;
}

std::optional<Option> currentOf(SourceRegistry& sources, const std::string& key) {
    KeyBuffer buffer(sources.keyBuffers());
    const Layer layer = sources.firstHolder(key, buffer);
    if (!layer) return std::nullopt;
    return Option(key, layer.entry().name, layer.value());
}

// Null when the change was kept.
std::exception_ptr keepIn(ChangePublisher& publisher, const OptionChange& change) noexcept {
    try {
        publisher.keep(change);
        return nullptr;
    } catch (...) {
        return std::current_exception();
    }
}

void reportSubscriberError(const std::string& prefix) noexcept {
    try {
        std::cerr << "Error in configuration change subscriber: " + prefix + '\n' << std::flush;
    } catch (...) {
        return;  // there is nowhere left to report to
    }
}

}  // namespace

void ChangeList::Due::serve() {
    for (const Stream& stream : streams) {
        try {
            if (stream.failure) {
                stream.publisher->fail(stream.failure);
            } else {
                stream.publisher->deliver();
            }
        } catch (...) {
            reportSubscriberError(stream.prefix);
        }
    }
    streams.clear();
}

ChangeList::Due::Stream& ChangeList::Due::of(const std::shared_ptr<ChangePublisher>& publisher,
                                             const std::string& prefix) {
    const auto noted = std::find_if(streams.begin(), streams.end(), [&](const Stream& stream) {
        return stream.publisher == publisher;
    });
    if (noted != streams.end()) return *noted;
    return streams.emplace_back(Stream{publisher, prefix, nullptr});
}

void ChangeList::add(std::shared_ptr<ChangePublisher> publisher, const std::string& prefix,
                     std::uint64_t streamId) {
    entries.push_back({std::move(publisher), prefix, streamId});
}

void ChangeList::keep(SourceRegistry& sources, const std::string& key, std::uint64_t version,
                      Due& due) const {
    const auto isTold = [&](const Entry& entry) { return begins(entry.prefix, key); };
    if (std::none_of(entries.begin(), entries.end(), isTold)) return;
    OptionChange change{key, std::nullopt, version};
    std::exception_ptr failure;
    try {
        change.option = currentOf(sources, key);
    } catch (...) {
        failure = std::current_exception();
    }
    // A source may have added or cancelled streams meanwhile. From here on no foreign code runs.
    for (const Entry& entry : entries) {
        if (!isTold(entry)) continue;
        Due::Stream& stream = due.of(entry.publisher, entry.prefix);
        if (!stream.failure) stream.failure = failure ? failure : keepIn(*entry.publisher, change);
    }
}

std::shared_ptr<ChangePublisher> ChangeList::remove(std::uint64_t streamId) {
    return take(std::find_if(entries.begin(), entries.end(),
                             [&](const Entry& entry) { return entry.streamId == streamId; }));
}

std::shared_ptr<ChangePublisher> ChangeList::removeOldest() {
    return take(entries.begin());
}

std::shared_ptr<ChangePublisher> ChangeList::take(std::vector<Entry>::iterator entry) {
    if (entry == entries.end()) return nullptr;
    auto publisher = std::move(entry->publisher);
    entries.erase(entry);
    return publisher;
}

}  // namespace velkor::configuration::detail
