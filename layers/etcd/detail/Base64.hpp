#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace velkor::layers::etcd {

/// `bytes` in the letters, digits, "+" and "/" of base64, filled up with "=".
std::string toBase64(std::string_view bytes);

/// The bytes that `text` stands for; nothing when it isn't what `toBase64` makes.
std::optional<std::string> fromBase64(std::string_view text);

}  // namespace velkor::layers::etcd
