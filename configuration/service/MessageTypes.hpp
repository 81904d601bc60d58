#pragma once

#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>
#include <utility>

#include "configuration/service/ConfigurationMessages.hpp"

/// The types of messages that make up the service. A new message is its class and its row here, the
/// row of its members where its JSON form is registered, and for a request the `handle` of the
/// provider with the instantiation of its base.
namespace velkor::configuration {

/// What the name of each message type begins with.
inline constexpr std::string_view messageTypePrefix = "velkor/configuration/";

/// The message type of the class `M`.
template <class M>
struct MessageType {
    using Class = M;

    /// Whether a `ConfigurationServiceProvider` answers it; the others are replies.
    static constexpr bool isRequest =
        std::is_base_of_v<ServiceMessage<ConfigurationServiceProvider>, M>;

    std::string_view shortName;  ///< The name of the class.

    /// The name under which the type is registered: the prefix and the short name.
    std::string name() const { return std::string(messageTypePrefix).append(shortName); }
};

/// All of them, in the order in which they are registered.
inline constexpr std::tuple messageTypes{
    MessageType<ConfigurationSet>{"ConfigurationSet"},
    MessageType<ConfigurationGet>{"ConfigurationGet"},
    MessageType<ConfigurationKeys>{"ConfigurationKeys"},
    MessageType<ConfigurationKeysResponse>{"ConfigurationKeysResponse"},
    MessageType<ConfigurationOptionResponse>{"ConfigurationOptionResponse"},
    MessageType<AddPropertyFileSource>{"AddPropertyFileSource"},
};

/// The message type of the class `M`.
template <class M>
inline constexpr MessageType<M> messageTypeOf = std::get<MessageType<M>>(messageTypes);

/// Calls `visit` with each message type, a `MessageType`, in their order.
template <class Visit>
void forEachMessageType(Visit&& visit) {
    std::apply([&](const auto&... type) { (visit(type), ...); }, messageTypes);
}

/// Calls `visit` with each message type that is a request.
template <class Visit>
void forEachRequestType(Visit&& visit) {
    forEachMessageType([&](const auto& type) {
        if (type.isRequest) visit(type);
    });
}

}  // namespace velkor::configuration
