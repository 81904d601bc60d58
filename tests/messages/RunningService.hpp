#pragma once

#include <memory>
#include <string>
#include <utility>
#include <variant>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationServiceProviderImpl.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "messages/MessageDispatcher.hpp"

namespace velkor::testing {

/// A store with its service running, reached by JSON text.
class RunningService {
public:
    RunningService() { provider->setRunning(true); }

    /// Sends a message; `type` is the name of its class in the configuration.
    messages::DispatchResult send(const std::string& type, const std::string& json) const {
        return dispatcher.dispatch({"velkor/configuration/" + type, json});
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<configuration::ConfigurationServiceProviderImpl> provider =
        std::make_shared<configuration::ConfigurationServiceProviderImpl>(store);
    std::shared_ptr<messages::JsonSerializerImpl> serializer =
        std::make_shared<messages::JsonSerializerImpl>();
    configuration::ConfigurationJsonSerialization serialization{serializer};
    messages::MessageDispatcher dispatcher{serializer, provider, everyType()};

private:
    static messages::MessageTypeNames everyType() {
        messages::MessageTypeNames names{"velkor/Message"};
        configuration::forEachMessageType([&](const auto& type) { names.insert(type.name()); });
        return names;
    }
};

/// The name of a failure, for readable comparisons.
inline std::string nameOf(messages::DispatchFailure failure) {
    switch (failure) {
        case messages::DispatchFailure::unknownType:
            return "unknown type";
        case messages::DispatchFailure::forbiddenType:
            return "forbidden type";
        case messages::DispatchFailure::noJsonObject:
            return "no JSON object";
        case messages::DispatchFailure::notRunning:
            return "not running";
        case messages::DispatchFailure::misrouted:
            return "misrouted";
        case messages::DispatchFailure::missingOption:
            return "missing option";
        case messages::DispatchFailure::notWritable:
            return "not writable";
        case messages::DispatchFailure::duplicateSource:
            return "duplicate source";
        case messages::DispatchFailure::fileNotOpened:
            return "file not opened";
        case messages::DispatchFailure::fileNotAllowed:
            return "file not allowed";
        case messages::DispatchFailure::other:
            return "other";
    }
    return "no such failure";
}

/// "reply TYPE JSON" or "failure KIND".
inline std::string outcomeOf(const messages::DispatchResult& result) {
    if (const auto* error = std::get_if<messages::DispatchError>(&result)) {
        return "failure " + nameOf(error->failure);
    }
    const auto& reply = std::get<messages::JsonMessage>(result);
    return "reply " + reply.type + " " + reply.json;
}

}  // namespace velkor::testing
