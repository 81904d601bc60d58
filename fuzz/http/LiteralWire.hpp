#pragma once

#include <string_view>

namespace velkor::fuzz::http {

/// Looks at what is read of `bytes`, the first of which says in how large pieces they come, as
/// requests over the wire.
void checkWire(std::string_view bytes);

}  // namespace velkor::fuzz::http
