#pragma once

#include <string>
#include <vector>

#include "configuration/Option.hpp"
#include "configuration/sources/SourceDescription.hpp"

namespace velkor::host {

// Answers of commands as one JSON object on one line. Values are objects of a type and a value as
// in messages; those of secrets are •••.

/// {"sources":[{"group":...,"name":...,"order":...,"problem":...,"readOnly":...,"state":{...}}]};
/// without the problem where there is none, and without the state of a source that tells none. A
/// state is {"details":{...},"lastError":...,"since":...,"updated":...,"well":...}, without what it
/// has not.
std::string sourcesJson(const std::vector<configuration::SourceDescription>& sources);

/// {"key":...,"layers":[{"source":...,"value":{...}}]}.
std::string layersJson(const std::string& key, const std::vector<configuration::Option>& holders,
                       bool isSecret);

/// {"key":...,"value":{...}}.
std::string watchedJson(const std::string& key, const configuration::ConfigurationValue& value,
                        bool isSecret);

}  // namespace velkor::host
