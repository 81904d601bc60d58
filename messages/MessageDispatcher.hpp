#pragma once

#include <memory>
#include <set>
#include <string>
#include <variant>

#include "framework/Message.hpp"
#include "framework/ServiceProvider.hpp"
#include "framework/common/Export.hpp"
#include "messages/JsonSerializerImpl.hpp"

namespace velkor::messages {

/// Why a request got no reply.
enum class DispatchFailure {
    unknownType,      ///< No message type of that name, or the reply has no JSON form.
    forbiddenType,    ///< The front end may not send messages of that type.
    noJsonObject,     ///< The text is no JSON object, or breaks a limit: see `parseJsonObject`.
    notRunning,       ///< The service is not running.
    misrouted,        ///< The message is not for the service.
    missingOption,    ///< The key has gone; a key that never was is answered without an option.
    notWritable,      ///< No source takes the write.
    duplicateSource,  ///< A source of that name is there already.
    fileNotOpened,    ///< The property file can't be opened.
    fileNotAllowed,   ///< The property file lies where it is not taken from.
    other,            ///< Anything else that the service failed with.
};

/// A request that got no reply.
struct DispatchError {
    DispatchFailure failure;
    std::string text;  ///< For people to read; it may repeat bytes of the request.
};

/// The reply, or why there is none.
using DispatchResult = std::variant<JsonMessage, DispatchError>;

/// The names of message types.
using MessageTypeNames = std::set<std::string>;

/// Answers the requests of one front end, which come as JSON text. Immutable: safe for concurrent
/// use as far as the service is. Shares the registry and the service with its other users.
class VELKOR_EXPORT MessageDispatcher {
public:
    /// Requests of the `allowed` types are built by `serializer` and delivered to `service`;
    /// neither is null.
    MessageDispatcher(std::shared_ptr<const JsonSerializerImpl> serializer,
                      std::shared_ptr<ServiceProvider> service, MessageTypeNames allowed);

    /// Delivers `request` and waits for the reply, on the calling thread and under no lock.
    /// Only lack of memory throws (`std::bad_alloc`). The acknowledgement of a request that has no
    /// reply of its own is of type "velkor/Message", with the text "{}".
    ///
    /// A type that is not allowed is refused before the text is looked at: "Message type not
    /// allowed: " and its name. The text of any other error is what the failing part says, or
    /// "Unknown error".
    DispatchResult dispatch(const JsonMessage& request) const;

private:
    void requireAllowed(const std::string& type) const;

    std::shared_ptr<const JsonSerializerImpl> serializer;
    std::shared_ptr<ServiceProvider> service;
    MessageTypeNames allowedTypes;
};

}  // namespace velkor::messages
