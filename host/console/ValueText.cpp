#include "host/console/ValueText.hpp"

#include <locale>
#include <sstream>

#include "configuration/admin/ValueFormat.hpp"

namespace velkor::host {

std::string valueText(const configuration::ConfigurationValue& value) {
    std::ostringstream out;
    out.imbue(std::locale::classic());
    configuration::formatValue(out, value);
    return out.str();
}

std::string optionText(const std::string& key, const configuration::ConfigurationValue& value) {
    return key + " = " + valueText(value);
}

}  // namespace velkor::host
