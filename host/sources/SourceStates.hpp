#pragma once

#include <optional>
#include <string>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"

namespace velkor::host {

/// How `source` stands; nothing when it doesn't say.
std::optional<configuration::SourceState> stateOf(const configuration::ConfigurationSource& source);

/// What is the matter with a source, "since TIME: REASON"; empty when it is well.
std::string problemText(const configuration::SourceState& state);

/// How a source stands that has details to tell, as "endpoint http://a:2379, revision 7, as of
/// TIME", when its values were last known to be right. For one that is well "since TIME" stands in
/// front, and an error that is over behind. Empty without details.
std::string standingText(const configuration::SourceState& state);

}  // namespace velkor::host
