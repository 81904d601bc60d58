#include "host/state/SqliteState.hpp"

#include <utility>

namespace velkor::host {

using configuration::RecordedChange;

namespace {

layers::SqliteOptions optionsFor(const std::string& author) {
    layers::SqliteOptions options;
    options.author = author;
    return options;
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

std::vector<RecordedChange> SqliteState::history(const std::string& keyOrPrefix,
                                                 std::size_t limit) {
    return layer->changes(keyOrPrefix, limit);
}

RecordedChange SqliteState::undo(std::optional<std::int64_t> number) {
    return recorded(layer->undo(number));
}

}  // namespace velkor::host
