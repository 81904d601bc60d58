#include "host/console/ValueText.hpp"

#include <locale>
#include <sstream>

#include "configuration/admin/ValueFormat.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

std::string valueText(const configuration::ConfigurationValue& value, bool isSecret) {
    std::ostringstream out;
    out.imbue(std::locale::classic());
    configuration::formatValue(out, value);
    return settings::masked(isSecret, out.str());
}

std::string optionText(const std::string& key, const configuration::ConfigurationValue& value,
                       bool isSecret) {
    return key + " = " + valueText(value, isSecret);
}

}  // namespace velkor::host
