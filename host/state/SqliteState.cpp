#include "host/state/SqliteState.hpp"

#include <algorithm>
#include <iterator>
#include <utility>

namespace velkor::host {

namespace {

using layers::JournalEntry;

layers::SqliteOptions optionsFor(const std::string& author) {
    layers::SqliteOptions options;
    options.author = author;
    return options;
}

StateChange changeOf(JournalEntry&& entry) {
    return {entry.change,
            entry.when,
            std::move(entry.author),
            std::string(nameOf(entry.action)),
            std::move(entry.key),
            std::move(entry.before),
            std::move(entry.after)};
}

}  // namespace

SqliteState::SqliteState(const std::string& path, const std::string& author)
    : layer(layers::SqliteSource::open(path, optionsFor(author))) {}

std::shared_ptr<configuration::ConfigurationSource> SqliteState::source() const {
    return layer;
}

void SqliteState::setFor(const std::string& key, configuration::ConfigurationValue value,
                         std::chrono::milliseconds lifetime) {
    layer->setFor(key, std::move(value), lifetime);
}

Future<bool> SqliteState::committed() {
    return layer->committed();
}

std::vector<StateChange> SqliteState::history(const std::string& keyOrPrefix, std::size_t limit) {
    auto entries = layer->history(keyOrPrefix, limit);
    std::vector<StateChange> changes;
    changes.reserve(entries.size());
    std::transform(std::make_move_iterator(entries.begin()), std::make_move_iterator(entries.end()),
                   std::back_inserter(changes), changeOf);
    return changes;
}

StateChange SqliteState::undo(std::optional<std::int64_t> number) {
    return changeOf(layer->undo(number));
}

}  // namespace velkor::host
