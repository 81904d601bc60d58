#include "layers/environment/EnvironmentSource.hpp"

#include <stdexcept>
#include <string_view>
#include <utility>

namespace velkor::layers {

namespace {

using configuration::ConfigurationValue;

configuration::ValueMap readVariables(const EnvironmentNames& names, const char* const* variables) {
    configuration::ValueMap values;
    for (; variables != nullptr && *variables != nullptr; ++variables) {
        const std::string_view variable = *variables;
        const auto equals = variable.find('=');
        if (equals == std::string_view::npos) continue;
        auto key = names.keyOf(variable.substr(0, equals));
        if (key) values.try_emplace(*std::move(key), std::string(variable.substr(equals + 1)));
    }
    return values;
}

}  // namespace

EnvironmentSource::EnvironmentSource(const EnvironmentNames& names, const char* const* variables)
    : TableSource(typeid(EnvironmentSource), readVariables(names, variables), Code::own) {}

ConfigurationValue EnvironmentSource::set(const std::string&, ConfigurationValue) {
    throw std::runtime_error("EnvironmentSource does not support writing");
}

}  // namespace velkor::layers
