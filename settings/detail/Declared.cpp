#include "settings/detail/Declared.hpp"

#include <locale>
#include <sstream>

#include "configuration/admin/ValueFormat.hpp"

namespace velkor::settings::detail {

namespace {

std::string textOfValue(const configuration::ConfigurationValue& value) {
    std::ostringstream text;
    text.imbue(std::locale::classic());
    text << std::boolalpha;
    configuration::formatValue(text, value);
    return text.str();
}

}  // namespace

std::string refusalOf(const Declared& declared, const configuration::Option& option,
                      const Reason& reason) {
    return declared.key + ": " + declared.shown(textOfValue(option.value)) + " from source \"" +
           option.source + "\" is no " + declared.type + ": " + reason.text;
}

std::string absenceOf(const Declared& declared) {
    return declared.key + ": no value, and no default";
}

std::string unfitDefaultOf(const Declared& declared, const Reason& reason) {
    return declared.key + ": the default " + declared.shown(declared.fallback.value_or("")) +
           " is not right: " + reason.text;
}

Reason failedCheck(bool secret, const char* text) {
    std::string reason = "the check has failed";
    if (!secret) reason.append(": ").append(text);
    return Reason{reason};
}

}  // namespace velkor::settings::detail
