#pragma once

#include <string>
#include <typeinfo>

#include "framework/common/Export.hpp"

/// The failures of routing a message to a service; each text is part of the interface.
namespace velkor::routing_errors {

inline constexpr const char* notRunning = "Service exists but is not running.";
inline constexpr const char* notForThisObject =
    "Unable to deliver to service. Incorrect message type. Expected: ";
inline constexpr const char* notForThisService = "Incorrect message type. Expected: ";
inline constexpr const char* butFound = " but found ";

}  // namespace velkor::routing_errors

namespace velkor {

/// The name of `type` as the platform reports it, less a leading '*'.
VELKOR_EXPORT std::string typeName(const std::type_info& type);

}  // namespace velkor
