#include "configuration/admin/ConfigurationCommandProvider.hpp"

#include <cstddef>
#include <cstdint>
#include <locale>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "configuration/admin/ValueFormat.hpp"

#include <locale.h>

namespace velkor::configuration {

namespace {

using Arguments = std::vector<std::string>;

// The calling thread reads numbers as the C locale writes them while this lives, whatever the host
// has set.
class ScopedCLocale {
public:
    ScopedCLocale() : previous(uselocale(cLocale())) {}
    ~ScopedCLocale() { uselocale(previous); }

    ScopedCLocale(const ScopedCLocale&) = delete;
    ScopedCLocale& operator=(const ScopedCLocale&) = delete;

private:
    static locale_t cLocale() {
        struct Owner {
            locale_t locale = newlocale(LC_ALL_MASK, "C", nullptr);
            ~Owner() { freelocale(locale); }
        };
        static const Owner owner;
        return owner.locale;
    }

    locale_t previous;
};

std::ostringstream textStream() {
    std::ostringstream out;
    out.imbue(std::locale::classic());
    return out;
}

ConfigurationValue parseNumber(const std::string& text) {
    const ScopedCLocale cLocale;
    if (text.find('.') != std::string::npos) return std::stod(text);
    return std::stoi(text);
}

std::string setValue(Configuration& configuration, const Arguments& arguments) {
    const std::string& key = arguments.at(0);
    const std::string& text = arguments.at(1);
    if (text == "true" || text == "false") {
        configuration.set(key, text == "true");
        return "";
    }
    try {
        configuration.set(key, parseNumber(text));
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
    const char* name;
    const char* description;
    std::string (*run)(Configuration&, const Arguments&);
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
};

constexpr Command commands[] = {
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
