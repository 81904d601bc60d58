#pragma once

#include <string>
#include <type_traits>
#include <utility>

#include "settings/detail/Declared.hpp"

namespace velkor::settings {

/// What a declaration says of a setting beside key, type, default and constraint. Attributes are
/// made by the functions below and given in any order.
class Attribute {
public:
    /// For use by the functions below.
    explicit Attribute(void (*sayIt)(detail::Declared&)) : say(sayIt) {}
    explicit Attribute(std::string text) : described(std::move(text)) {}

    /// Notes the attribute in `declared`.
    void addTo(detail::Declared& declared) const {
        if (say == nullptr) {
            declared.description = described;
        } else {
            say(declared);
        }
    }

private:
    void (*say)(detail::Declared&) = nullptr;
    std::string described;
};

/// What the setting is for, for those who list settings.
inline Attribute description(std::string text) {
    return Attribute(std::move(text));
}

/// The value is shown as ••• wherever this library shows it: in errors and log records of this
/// setting, and to whoever lists the settings of the store. Consoles ask `secretKeys`. Of several
/// settings of one key each says so.
inline Attribute secret() {
    return Attribute([](detail::Declared& declared) { declared.secret = true; });
}

/// Says that the program looks at the setting when it starts only. The setting itself follows the
/// store as any other.
inline Attribute needsRestart() {
    return Attribute([](detail::Declared& declared) { declared.needsRestart = true; });
}

/// A value that does not fit at construction gives the default instead of a `SettingError`; it is
/// logged and found in the status.
inline Attribute orDefault() {
    return Attribute([](detail::Declared& declared) { declared.orDefault = true; });
}

}  // namespace velkor::settings
