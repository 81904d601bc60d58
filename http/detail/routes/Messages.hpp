#pragma once

#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// POST /velkor/configuration/TYPE: the request in the body, in the JSON form of messages, is
/// answered as the service of the store answers it.

/// What reads.
void answerGet(const Context& context, Call& call);
void answerKeys(const Context& context, Call& call);

/// What writes. Answered once the layers that last have committed it.
void answerSet(const Context& context, Call& call);
void answerAddFile(const Context& context, Call& call);

/// A type that there is not.
void answerUnknownType(const Context& context, Call& call);

}  // namespace velkor::http::detail
