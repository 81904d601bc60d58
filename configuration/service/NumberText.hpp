#pragma once

#include <string>

/// How numbers and truth values are read from texts.
namespace velkor::configuration {

/// Reads `text` into `content` and gives true when `Poco::NumberParser` takes it; otherwise gives
/// false, and `content` is undetermined. In time proportional to the size of the text. Stateless.
bool parseText(const std::string& text, bool& content);
bool parseText(const std::string& text, int& content);
bool parseText(const std::string& text, unsigned int& content);
bool parseText(const std::string& text, double& content);

}  // namespace velkor::configuration
