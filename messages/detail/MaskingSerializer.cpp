#include "messages/detail/MaskingSerializer.hpp"

#include <utility>

#include "configuration/service/ConfigurationMessages.hpp"

namespace velkor::messages::detail {

namespace {

using configuration::ConfigurationOptionResponse;
using Serialise = json::JsonSerializer::Serialise;

Serialise masking(Serialise serialise, const Secrets& secrets) {
    return [serialise = std::move(serialise), secrets](const std::unique_ptr<Message>& message) {
        auto object = serialise(message);
        const auto& option = static_cast<const ConfigurationOptionResponse&>(*message).option;
        if (option != nullptr && secrets.contains(option->key)) {
            object->getObject("value")->set("value", secrets.mark);
        }
        return object;
    };
}

}  // namespace

MaskingSerializer::MaskingSerializer(std::shared_ptr<json::JsonSerializer> registry,
                                     Secrets maskedOptions)
    : serializer(std::move(registry)), secrets(std::move(maskedOptions)) {}

void MaskingSerializer::registerMessage(const std::string& name, const std::type_info& type,
                                        Serialise serialise, Deserialise deserialise) {
    if (secrets.contains && type == typeid(ConfigurationOptionResponse)) {
        serialise = masking(std::move(serialise), secrets);
    }
    serializer->registerMessage(name, type, std::move(serialise), std::move(deserialise));
}

void MaskingSerializer::unregisterMessage(const std::type_info& type) {
    serializer->unregisterMessage(type);
}

}  // namespace velkor::messages::detail
