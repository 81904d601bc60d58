#include "host/console/SendCommand.hpp"

#include <variant>

#include "configuration/service/MessageTypes.hpp"
#include "host/console/Command.hpp"
#include "messages/JsonText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

std::string fullTypeName(const std::string& type) {
    if (type.find('/') != std::string::npos) return type;
    return std::string(configuration::messageTypePrefix).append(type);
}

// The content of `reply` as an operator may see it.
std::string shownContent(const messages::JsonMessage& reply, const std::set<std::string>& secret) {
    using configuration::ConfigurationOptionResponse;
    const bool hasValue =
        reply.type == configuration::messageTypeOf<ConfigurationOptionResponse>.name();
    if (secret.empty() || !hasValue) return reply.json;
    const auto content = messages::parseJsonObject(reply.json);
    if (secret.count(content->optValue<std::string>("key", "")) == 0) return reply.json;
    content->getObject("value")->set("value", std::string(settings::secretMark));
    return messages::renderJson(*content);
}

}  // namespace

std::string sendMessage(const messages::MessageDispatcher& dispatcher,
                        const std::vector<std::string>& arguments,
                        const std::set<std::string>& secret) {
    const std::string json = arguments.size() > 1 ? arguments[1] : "{}";
    const auto result = dispatcher.dispatch({fullTypeName(arguments.at(0)), json});
    if (const auto* error = std::get_if<messages::DispatchError>(&result))
        throw CommandError(error->text);
    const auto& reply = std::get<messages::JsonMessage>(result);
    return reply.type + ' ' + shownContent(reply, secret);
}

std::vector<std::string> requestTypes() {
    std::vector<std::string> names;
    configuration::forEachRequestType(
        [&](const auto& type) { names.emplace_back(type.shortName); });
    return names;
}

}  // namespace velkor::host
