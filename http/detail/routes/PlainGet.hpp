#pragma once

#include <optional>
#include <string_view>

namespace velkor::http::detail {

/// The key of `{"key":"KEY"}`, the form in which nearly all ConfigurationGet come: visible ASCII
/// characters and blanks that nothing escapes, with white space wherever JSON has it. Nothing for
/// any other text, which may well be a request.
std::optional<std::string_view> keyOfPlainGet(std::string_view json) noexcept;

}  // namespace velkor::http::detail
