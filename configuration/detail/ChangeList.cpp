#include "configuration/detail/ChangeList.hpp"

#include <algorithm>
#include <cstddef>
#include <list>
#include <new>
#include <string_view>
#include <utility>

#include "configuration/detail/SubscriberErrors.hpp"

namespace velkor::configuration::detail {

namespace {

// Whether there is memory for what a subscriber does when its stream fails: opens another one.
bool isMemoryLeft() noexcept {
    constexpr std::size_t plenty = std::size_t{16} * 1024;
    try {
        ::operator delete(::operator new(plenty));
        return true;
    } catch (const std::bad_alloc&) {
        return false;
    }
}

bool begins(const std::string& prefix, const std::string& key) {
    return std::string_view(key).substr(0, prefix.size()) == prefix;
}

void readInto(OptionChange& change, SourceRegistry& sources) {
    KeyBuffer buffer(sources.keyBuffers());
    const Layer layer = sources.firstHolder(change.key, buffer);
    if (layer) change.option.emplace(change.key, layer.entry().name, layer.value());
}

// Null when the change was kept. It is moved from for the last one.
std::exception_ptr keepIn(ChangePublisher& publisher, std::list<OptionChange>& change,
                          bool isLast) noexcept {
    try {
        publisher.keep(isLast ? std::move(change) : change);
        return nullptr;
    } catch (...) {
        return std::current_exception();
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
            reportSubscriberError("change", stream.prefix);
        }
    }
    streams.clear();
}

void ChangeList::Due::note(const Entry& entry) noexcept {
    const auto noted = std::find_if(streams.begin(), streams.end(), [&](const Stream& stream) {
        return stream.publisher == entry.publisher;
    });
    if (noted != streams.end()) {
        noted->failure = entry.failure;
        return;
    }
    try {
        streams.emplace_back(Stream{entry.publisher, entry.prefix, entry.failure});
    } catch (const std::bad_alloc&) {
        return;  // what is kept, or missing, shows with the next change
    }
}

void ChangeList::add(std::shared_ptr<ChangePublisher> publisher, const std::string& prefix,
                     std::uint64_t streamId) {
    entries.push_back({std::move(publisher), prefix, streamId, nullptr});
}

void ChangeList::keep(SourceRegistry& sources, const std::string& key, std::uint64_t version,
                      Due& due) {
    const auto isTold = [&](const Entry& entry) { return begins(entry.prefix, key); };
    if (std::none_of(entries.begin(), entries.end(), isTold)) return;
    std::list<OptionChange> change;
    std::exception_ptr failure;
    try {
        change.emplace_back();
        change.back().key = key;
        change.back().version = version;
        readInto(change.back(), sources);
    } catch (...) {
        failure = std::current_exception();
    }
    // A source may have added or cancelled streams meanwhile. From here on no foreign code runs.
    const auto last = std::find_if(entries.rbegin(), entries.rend(), isTold);
    for (Entry& entry : entries) {
        if (!isTold(entry)) continue;
        if (!entry.failure) {
            entry.failure = failure ? failure : keepIn(*entry.publisher, change, &entry == &*last);
        }
        // A stream that failed while nobody can open another one would be the last.
        if (!entry.failure || isMemoryLeft()) due.note(entry);
    }
}

void ChangeList::failAll(const std::exception_ptr& reason) noexcept {
    for (Entry& entry : entries) entry.failure = reason;
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
