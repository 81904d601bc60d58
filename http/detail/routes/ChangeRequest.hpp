#pragma once

#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "messages/JsonText.hpp"

namespace velkor::http::detail {

/// The changes that `text` asks for:
///
///     {"changes":[{"key":K,"value":{"type":T,"value":V},"source":S},{"key":K,"unset":true}]}
///
/// "source" may be missing. Read strictly, as what is not understood must not be written: any other
/// member, and any value that is not of the form of its type, is refused. Throws
/// `messages::NoJsonObject`, see `parseJsonObject`, and `Problem` of the kind badRequest, which
/// says where and what is wrong and repeats no value.
std::vector<configuration::Change> parsedChanges(const std::string& text,
                                                 const messages::JsonLimits& limits);

}  // namespace velkor::http::detail
