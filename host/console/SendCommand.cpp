#include "host/console/SendCommand.hpp"

#include <variant>

#include "host/console/Command.hpp"

namespace velkor::host {

namespace {

constexpr const char* typePrefix = "velkor/configuration/";

std::string fullTypeName(const std::string& type) {
    return type.find('/') == std::string::npos ? typePrefix + type : type;
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
    return {"ConfigurationGet", "ConfigurationSet", "ConfigurationKeys", "AddPropertyFileSource"};
}

}  // namespace velkor::host
