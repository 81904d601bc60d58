#pragma once

#include <set>
#include <string>
#include <vector>

#include "messages/MessageDispatcher.hpp"

namespace velkor::host {

/// Delivers the message that `arguments`, TYPE [JSON], describe and gives the reply as one line,
/// the type and the JSON text.
///
/// TYPE is the name of a message type, or its last word; JSON is {} when there is none. A request
/// without a reply throws `CommandError` with the dispatcher's text; one without a TYPE
/// `std::out_of_range`. The reply shows the values of the `secret` keys as •••.
std::string sendMessage(const messages::MessageDispatcher& dispatcher,
                        const std::vector<std::string>& arguments,
                        const std::set<std::string>& secret);

/// The last words of the types that can be sent.
std::vector<std::string> requestTypes();

}  // namespace velkor::host
