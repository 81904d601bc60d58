#include "host/console/ValueText.hpp"

#include <locale>

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

OptionWriter::OptionWriter() {
    values.imbue(std::locale::classic());
}

const std::string& OptionWriter::text(const std::string& key,
                                      const configuration::ConfigurationValue& value,
                                      bool isSecret) {
    line.assign(key) += " = ";
    if (isSecret) return line += settings::secretMark;
    values.str("");
    configuration::formatValue(values, value);
    return line += values.str();
}

}  // namespace velkor::host
