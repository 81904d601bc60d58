#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::fuzz::http {

/// `text` as JSON says it: in quotes, with the short escapes where there are some, and U+FFFD for
/// what is no UTF-8.
std::string jsonText(const std::string& text);

/// `value` as an object of its type and itself; a secret one as "•••".
std::string jsonValue(const configuration::ConfigurationValue& value, bool isSecret = false);

/// "key" and its value; with "href" where JSON can't hold `key`.
std::string jsonKey(const std::string& key);

/// `bytes` with all but letters, digits and "-._~" as "%41".
std::string percentCode(const std::string& bytes);

/// Whether `text` is UTF-8.
bool isCleanText(const std::string& text);

}  // namespace velkor::fuzz::http
