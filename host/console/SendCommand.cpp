#include "host/console/SendCommand.hpp"

#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace velkor::host {

namespace {

constexpr const char* commandName = "send";
constexpr const char* typePrefix = "velkor/configuration/";

std::vector<std::string> requestTypes() {
    return {"ConfigurationGet", "ConfigurationSet", "ConfigurationKeys", "AddPropertyFileSource"};
}

std::string fullTypeName(const std::string& type) {
    return type.find('/') == std::string::npos ? typePrefix + type : type;
}

std::string send(const MessageDispatcher& dispatcher, const std::vector<std::string>& arguments) {
    const std::string json = arguments.size() > 1 ? arguments[1] : "{}";
    const auto result = dispatcher.dispatch({fullTypeName(arguments.at(0)), json});
    if (const auto* error = std::get_if<DispatchError>(&result)) throw CommandError(error->text);
    const auto& reply = std::get<JsonMessage>(result);
    return reply.type + ' ' + reply.json;
}

}  // namespace

SendCommand::SendCommand(std::shared_ptr<const MessageDispatcher> dispatcher,
                         std::shared_ptr<CommandRegistry> commandRegistry)
    : registry(std::move(commandRegistry)) {
    CommandTraits traits;
    traits.arguments = "TYPE [JSON]";
    traits.takesRawRest = true;
    traits.suggestions = requestTypes;
    const auto handler = [dispatcher =
                              std::move(dispatcher)](std::vector<std::string>&& arguments) {
        return send(*dispatcher, arguments);
    };
    registry->registerCommand(
        {commandName, "Send a message to the service and show its reply.", handler, 1, 2},
        std::move(traits));
}

SendCommand::~SendCommand() {
    registry->unregisterCommand(commandName);
}

}  // namespace velkor::host
