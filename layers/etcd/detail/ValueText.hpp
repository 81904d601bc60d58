#pragma once

#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::layers::etcd {

/// `value` as it stands in etcd: one JSON object of "type" and "value", as in messages. Exact for
/// every value of every kind: where JSON has no way to say it (bytes that are no UTF-8, half a
/// surrogate pair, a number that is not finite) "exact" is a third member with the base64 of what
/// `detail::encoded` makes of it.
std::string toValueText(const configuration::ConfigurationValue& value);

/// The value that `text` stands for. What is no such object, to the letter, is a narrow text of
/// those bytes, so that any tool can write one.
configuration::ConfigurationValue fromValueText(std::string_view text);

}  // namespace velkor::layers::etcd
