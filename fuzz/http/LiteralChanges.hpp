#pragma once

#include <optional>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"

namespace velkor::fuzz::http {

/// The changes that the body of a PATCH asks for; nothing if it is not exactly of the form that
/// docs/http-api.md shows.
std::optional<std::vector<configuration::Change>> readChanges(const std::string& body);

}  // namespace velkor::fuzz::http
