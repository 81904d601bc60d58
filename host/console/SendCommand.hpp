#pragma once

#include <memory>

#include "framework/administration/CommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/messages/MessageDispatcher.hpp"

namespace velkor::host {

/// Keeps the command "send" TYPE [JSON] registered while it lives: it delivers one message and
/// shows the reply as one line, the type and the JSON text.
///
/// TYPE is the name of a message type, or its last word. JSON is the rest of the line as it was
/// typed, {} when there is none. A request without a reply throws `CommandError` with the
/// dispatcher's text. The handler shares the dispatcher, so it may run after this object is gone.
class SendCommand final : public administration::CommandProvider {
public:
    SendCommand(std::shared_ptr<const MessageDispatcher> dispatcher,
                std::shared_ptr<CommandRegistry> registry);
    SendCommand(const SendCommand&) = delete;
    SendCommand& operator=(const SendCommand&) = delete;
    ~SendCommand() override;

private:
    std::shared_ptr<CommandRegistry> registry;
};

}  // namespace velkor::host
