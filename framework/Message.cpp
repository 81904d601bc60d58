#include "framework/Message.hpp"

namespace velkor {

Message::~Message() = default;

Context::~Context() = default;

}  // namespace velkor
