#include "host/console/SendCommand.hpp"

#include <variant>

#include "configuration/service/MessageTypes.hpp"
#include "host/console/Command.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

std::string fullTypeName(const std::string& type) {
    if (type.find('/') != std::string::npos) return type;
    return std::string(configuration::messageTypePrefix).append(type);
}

}  // namespace

std::string sendMessage(const messages::MessageDispatcher& dispatcher,
                        const std::vector<std::string>& arguments) {
    const std::string json = arguments.size() > 1 ? arguments[1] : "{}";
    const auto result = dispatcher.dispatch({fullTypeName(arguments.at(0)), json});
    if (const auto* error = std::get_if<messages::DispatchError>(&result))
        throw CommandError(error->text);
    const auto& reply = std::get<messages::JsonMessage>(result);
    return reply.type + ' ' + reply.json;
}

messages::Secrets secretsOf(const std::shared_ptr<configuration::ConfigurationImpl>& store) {
    return {[store](const std::string& key) { return settings::isSecret(store, key); },
            settings::secretMark};
}

std::vector<std::string> requestTypes() {
    std::vector<std::string> names;
    configuration::forEachRequestType(
        [&](const auto& type) { names.emplace_back(type.shortName); });
    return names;
}

}  // namespace velkor::host
