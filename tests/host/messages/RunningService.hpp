#pragma once

#include <memory>
#include <string>
#include <utility>
#include <variant>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationServiceProviderImpl.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "host/messages/JsonSerializerImpl.hpp"
#include "host/messages/MessageDispatcher.hpp"

namespace velkor::testing {

/// A store with its service running, reached by JSON text.
class RunningService {
public:
    RunningService() { provider->setRunning(true); }

    /// Sends a message; `type` is the name of its class in the configuration.
    host::DispatchResult send(const std::string& type, const std::string& json) const {
        return dispatcher.dispatch({"velkor/configuration/" + type, json});
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<configuration::ConfigurationServiceProviderImpl> provider =
        std::make_shared<configuration::ConfigurationServiceProviderImpl>(store);
    std::shared_ptr<host::JsonSerializerImpl> serializer =
        std::make_shared<host::JsonSerializerImpl>();
    configuration::ConfigurationJsonSerialization serialization{serializer};
    host::MessageDispatcher dispatcher{serializer, provider, everyType()};

private:
    static host::MessageTypeNames everyType() {
        host::MessageTypeNames names{"velkor/Message"};
        configuration::forEachMessageType([&](const auto& type) { names.insert(type.name()); });
        return names;
    }
};

/// The name of a failure, for readable comparisons.
inline std::string nameOf(host::DispatchFailure failure) {
    switch (failure) {
        case host::DispatchFailure::unknownType:
            return "unknown type";
        case host::DispatchFailure::forbiddenType:
            return "forbidden type";
        case host::DispatchFailure::noJsonObject:
            return "no JSON object";
        case host::DispatchFailure::notRunning:
            return "not running";
        case host::DispatchFailure::misrouted:
            return "misrouted";
        case host::DispatchFailure::missingOption:
            return "missing option";
        case host::DispatchFailure::notWritable:
            return "not writable";
        case host::DispatchFailure::duplicateSource:
            return "duplicate source";
        case host::DispatchFailure::fileNotOpened:
            return "file not opened";
        case host::DispatchFailure::other:
            return "other";
    }
    return "no such failure";
}

/// "reply TYPE JSON" or "failure KIND".
inline std::string outcomeOf(const host::DispatchResult& result) {
    if (const auto* error = std::get_if<host::DispatchError>(&result)) {
        return "failure " + nameOf(error->failure);
    }
    const auto& reply = std::get<host::JsonMessage>(result);
    return "reply " + reply.type + " " + reply.json;
}

}  // namespace velkor::testing
