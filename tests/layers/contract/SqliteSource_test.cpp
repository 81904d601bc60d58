#include "layers/sqlite/SqliteSource.hpp"

#include <chrono>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "layers/testing/SourceContract.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using namespace layers::testing;

// What changes by itself is what was written for a time.
class Sqlite : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        source = SqliteSource::open(folder.parent() / "state.db");
        for (const auto& [key, value] : values) source->set(key, value);
        return source;
    }

    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        if (value) {
            source->setFor(key, *value, std::chrono::hours(1));
        } else {
            source->unset(key);
        }
    }

private:
    const velkor::testing::TemporaryFile folder{""};
    std::shared_ptr<SqliteSource> source;
};

VELKOR_SOURCE_CONTRACT(SqliteSource, Sqlite);

}  // namespace
}  // namespace velkor::layers
