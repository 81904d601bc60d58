#include "host/console/SendCommand.hpp"

#include <variant>

#include "configuration/service/MessageTypes.hpp"
#include "host/console/Command.hpp"

namespace velkor::host {

namespace {

std::string fullTypeName(const std::string& type) {
    if (type.find('/') != std::string::npos) return type;
    return std::string(configuration::messageTypePrefix).append(type);
}

}  // namespace

std::string sendMessage(const MessageDispatcher& dispatcher,
                        const std::vector<std::string>& arguments) {
    const std::string json = arguments.size() > 1 ? arguments[1] : "{}";
    const auto result = dispatcher.dispatch({fullTypeName(arguments.at(0)), json});
    if (const auto* error = std::get_if<DispatchError>(&result)) throw CommandError(error->text);
    const auto& reply = std::get<JsonMessage>(result);
    return reply.type + ' ' + reply.json;
}

std::vector<std::string> requestTypes() {
    std::vector<std::string> names;
    configuration::forEachRequestType(
        [&](const auto& type) { names.emplace_back(type.shortName); });
    return names;
}

}  // namespace velkor::host
