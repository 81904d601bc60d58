#pragma once

#include <memory>
#include <string>
#include <variant>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/ServiceProvider.hpp"
#include "host/messages/JsonSerializerImpl.hpp"

namespace velkor::host {

/// Why a request got no reply.
enum class DispatchFailure {
    unknownType,   ///< No message type of that name, or the reply has no JSON form.
    noJsonObject,  ///< The text is no JSON object, or breaks a limit: see `parseJsonObject`.
    notRunning,    ///< The service is not running.
    routing,       ///< The message is not for the service.
    service,       ///< The service refused: an error of the store, for example.
};

/// A request that got no reply.
struct DispatchError {
    DispatchFailure failure;
    std::string text;  ///< For people to read; it may repeat bytes of the request.
};

/// The reply, or why there is none.
using DispatchResult = std::variant<JsonMessage, DispatchError>;

/// Answers requests that come as JSON text. Immutable: safe for concurrent use as far as the
/// service is. Shares the registry and the service with the rest of the host.
class MessageDispatcher {
public:
    /// Requests are built by `serializer` and delivered to `service`; neither is null.
    MessageDispatcher(std::shared_ptr<const JsonSerializerImpl> serializer,
                      std::shared_ptr<ServiceProvider> service);

    /// Delivers `request` and waits for the reply, on the calling thread and under no lock.
    /// Only lack of memory throws (`std::bad_alloc`). The acknowledgement of a request that has no
    /// reply of its own is of type "velkor/Message", with the text "{}". The text of an error is
    /// what the failing part says, or "Unknown error".
    DispatchResult dispatch(const JsonMessage& request) const;

private:
    DispatchResult encodeReply(Future<std::unique_ptr<Message>> future) const;

    std::shared_ptr<const JsonSerializerImpl> serializer;
    std::shared_ptr<ServiceProvider> service;
};

}  // namespace velkor::host
