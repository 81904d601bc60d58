#include "host/look/PlainText.hpp"

#include <boost/variant/apply_visitor.hpp>
#include <type_traits>

#include "settings/Conversion.hpp"

namespace velkor::host {

std::string plainText(const configuration::ConfigurationValue& value) {
    return boost::apply_visitor(
        [](const auto& held) {
            return settings::Conversion<std::decay_t<decltype(held)>>::show(held);
        },
        value);
}

}  // namespace velkor::host
