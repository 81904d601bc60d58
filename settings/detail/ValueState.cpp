#include "settings/detail/ValueState.hpp"

#include "settings/Loggers.hpp"

namespace velkor::settings::detail {

void reportCallback(const std::string& name, const char* text) {
    settingsLogger.write(common::error, name, ": a callback has failed: ", text);
}

}  // namespace velkor::settings::detail
