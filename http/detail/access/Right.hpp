#pragma once

namespace velkor::http::detail {

/// What a request needs, and a token gives: each includes those before it.
enum class Right { none, read, write };

}  // namespace velkor::http::detail
