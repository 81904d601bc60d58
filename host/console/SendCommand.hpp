#pragma once

#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "messages/MessageDispatcher.hpp"
#include "messages/Secrets.hpp"

namespace velkor::host {

/// Delivers the message that `arguments`, TYPE [JSON], describe and gives the reply as one line,
/// the type and the JSON text.
///
/// TYPE is the name of a message type, or its last word; JSON is {} when there is none. A request
/// without a reply throws `CommandError` with the dispatcher's text; one without a TYPE
/// `std::out_of_range`.
std::string sendMessage(const messages::MessageDispatcher& dispatcher,
                        const std::vector<std::string>& arguments);

/// The options whose values the reply to a message does not show: those of the secret keys of
/// `store`, see `settings::secretKeys`. Shares the store.
messages::Secrets secretsOf(const std::shared_ptr<configuration::ConfigurationImpl>& store);

/// The last words of the types that can be sent.
std::vector<std::string> requestTypes();

}  // namespace velkor::host
