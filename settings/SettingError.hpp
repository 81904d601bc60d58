#pragma once

#include <stdexcept>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::settings {

/// Why a setting could not be constructed. Names the key, the source, the value (••• if the setting
/// is secret), the type that is wanted and the reason: "server.port: 'abc' from source "site" is
/// no int: not a whole number in plain digits". Of a struct, all errors, separated by "; ".
class VELKOR_EXPORT SettingError : public std::runtime_error {
public:
    explicit SettingError(const std::string& text);
    SettingError(const SettingError&) = default;
    SettingError& operator=(const SettingError&) = default;
    ~SettingError() override;
};

}  // namespace velkor::settings
