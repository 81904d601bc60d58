#include "settings/testing/Override.hpp"

#include <atomic>
#include <cstdint>
#include <exception>
#include <limits>

#include "settings/Loggers.hpp"

namespace velkor::settings::testing {

namespace {

std::string nextName() {
    static std::atomic<std::uint64_t> last{0};
    return "test override " + std::to_string(++last);
}

void reportEnd(const std::string& source, const char* text) noexcept {
    try {
        settingsLogger.write(common::error, source, ": has ended badly: ", text);
    } catch (...) {
        return;  // there is nowhere left to report to
    }
}

}  // namespace

Override::Override(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
                   configuration::ConfigurationValue value, Made)
    : overridden(store), source(nextName()) {
    configuration::ValueMap values;
    values.emplace(std::move(key), std::move(value));
    // Read-only, so that writes leave the override alone.
    try {
        overridden
            ->addInMemorySource(source, "", std::numeric_limits<int>::min(), true,
                                std::move(values))
            .get();
    } catch (...) {
        end();  // it may be there all the same
        throw;
    }
}

Override::~Override() {
    end();
}

void Override::end() noexcept {
    try {
        overridden->removeSource(source);
    } catch (const std::exception& error) {
        reportEnd(source, error.what());
    }
}

}  // namespace velkor::settings::testing
