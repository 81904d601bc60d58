#include "configuration/admin/ConfigurationCommandProvider.hpp"

#include <cstddef>
#include <cstdint>
#include <ios>
#include <locale>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "configuration/admin/TypedText.hpp"
#include "configuration/admin/ValueFormat.hpp"

namespace velkor::configuration {

namespace {

using Arguments = std::vector<std::string>;

// Throws what keeps a text from being complete, which a stream would only note otherwise.
std::ostringstream textStream() {
    std::ostringstream out;
    out.exceptions(std::ios_base::badbit);
    out.imbue(std::locale::classic());
    return out;
}

bool isNumber(const ConfigurationValue& value) {
    return boost::get<int>(&value) != nullptr || boost::get<double>(&value) != nullptr;
}

std::string setValue(Configuration& configuration, const Arguments& arguments) {
    const std::string& key = arguments.at(0);
    const std::string& text = arguments.at(1);
    ConfigurationValue value = typedText(text);
    if (!isNumber(value)) {
        configuration.set(key, std::move(value));
        return "";
    }
    try {
        configuration.set(key, std::move(value));
    } catch (...) {
        configuration.set(key, text);
    }
    return "";
}

std::string getValue(Configuration& configuration, const Arguments& arguments) {
    const std::string& key = arguments.at(0);
    if (!configuration.has(key).get()) return "No configuration option with key: " + key;
    std::ostringstream out = textStream();
    formatValue(out, configuration.get(key).get());
    return out.str();
}

std::string listValues(Configuration& configuration, const Arguments&) {
    std::ostringstream out = textStream();
    for (const auto& key : configuration.keys().get()) {
        out << key << " = ";
        formatValue(out, configuration.get(key).get());
        out << '\n';
    }
    return out.str();
}

struct Command {
    std::string name;
    const char* description;
    std::string (*run)(Configuration&, const Arguments&);
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
};

// With names that take no memory any more: commands are withdrawn where there may be none left.
const Command commands[] = {
    {"velkor.configuration.set", "Set a configuration value.", setValue, 2, 2},
    {"velkor.configuration.get", "Get a specific configuration value.", getValue, 1, 1},
    {"velkor.configuration.list", "List all configuration options.", listValues, 0, 255},
};

administration::CommandHandler handlerOf(const Command& command,
                                         const std::shared_ptr<Configuration>& configuration) {
    return [run = command.run, configuration](Arguments&& arguments) {
        return run(*configuration, arguments);
    };
}

administration::CommandDescriptor descriptorOf(
    const Command& command, const std::shared_ptr<Configuration>& configuration) {
    return {command.name, command.description, handlerOf(command, configuration),
            command.minimumArguments, command.maximumArguments};
}

// Withdraws the first `count` commands, each whatever became of the others.
void withdrawQuietly(administration::Administration& registry, std::size_t count) noexcept {
    for (std::size_t row = 0; row < count; ++row) {
        try {
            registry.unregisterCommand(commands[row].name);
        } catch (...) {
            continue;
        }
    }
}

}  // namespace

ConfigurationCommandProvider::ConfigurationCommandProvider(
    std::shared_ptr<Configuration> store, std::shared_ptr<administration::Administration> registry)
    : configuration(std::move(store)), administration(std::move(registry)) {
    std::size_t offered = 0;
    try {
        for (const Command& command : commands) {
            auto descriptor = descriptorOf(command, configuration);
            ++offered;  // a registry that throws may have taken the command nevertheless
            administration->registerCommand(std::move(descriptor));
        }
    } catch (...) {
        withdrawQuietly(*administration, offered);
        throw;
    }
}

ConfigurationCommandProvider::~ConfigurationCommandProvider() {
    for (const Command& command : commands) administration->unregisterCommand(command.name);
    administration.reset();
    configuration.reset();
}

}  // namespace velkor::configuration
