#pragma once

#include <memory>
#include <string>

#include "host/state/StateLayer.hpp"
#include "layers/sqlite/SqliteSource.hpp"

namespace velkor::host {

/// The layer that lasts, in an SQLite database.
class SqliteState final : public StateLayer {
public:
    /// Opens the file at `path`, as `layers::SqliteSource::open` does.
    SqliteState(const std::string& path, const std::string& author);

    std::shared_ptr<configuration::ConfigurationSource> source() const override;
    void setFor(const std::string& key, configuration::ConfigurationValue value,
                std::chrono::milliseconds lifetime) override;
    Future<bool> committed() override;
    std::vector<configuration::RecordedChange> history(const std::string& keyOrPrefix,
                                                       std::size_t limit) override;
    configuration::RecordedChange undo(std::optional<std::int64_t> number) override;

private:
    const std::shared_ptr<layers::SqliteSource> layer;
};

}  // namespace velkor::host
