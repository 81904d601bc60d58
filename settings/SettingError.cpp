#include "settings/SettingError.hpp"

namespace velkor::settings {

SettingError::SettingError(const std::string& text) : std::runtime_error(text) {}

SettingError::~SettingError() = default;

}  // namespace velkor::settings
