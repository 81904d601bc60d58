#include "settings/testing/Override.hpp"

#include <atomic>
#include <cstdint>
#include <limits>

namespace velkor::settings::testing {

namespace {

std::string nextName() {
    static std::atomic<std::uint64_t> last{0};
    return "test override " + std::to_string(++last);
}

}  // namespace

Override::Override(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
                   configuration::ConfigurationValue value, Made)
    : overridden(store), source(nextName()) {
    configuration::ValueMap values;
    values.emplace(std::move(key), std::move(value));
    // Read-only, so that writes leave the override alone.
    overridden
        ->addInMemorySource(source, "", std::numeric_limits<int>::min(), true, std::move(values))
        .get();
}

Override::~Override() {
    overridden->removeSource(source);
}

}  // namespace velkor::settings::testing
