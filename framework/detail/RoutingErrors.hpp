#pragma once

#include <memory>
#include <string>
#include <typeinfo>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/common/Export.hpp"

/// The failures of routing a message to a service; each text is part of the interface.
namespace velkor::detail::routing_errors {

inline constexpr const char* notRunning = "Service exists but is not running.";
inline constexpr const char* notForThisObject =
    "Unable to deliver to service. Incorrect message type. Expected: ";
inline constexpr const char* notForThisService = "Incorrect message type. Expected: ";
inline constexpr const char* butFound = " but found ";

}  // namespace velkor::detail::routing_errors

namespace velkor::detail {

/// The name of `type` as the platform reports it, less a leading '*'.
VELKOR_EXPORT std::string typeName(const std::type_info& type);

/// The run-time type of `message`. Throws `std::bad_typeid` when it is null.
VELKOR_EXPORT const std::type_info& typeOf(const Message* message);

/// A future failed with `std::runtime_error` `routing_errors::notRunning`.
VELKOR_EXPORT Future<std::unique_ptr<Message>> failNotRunning();

/// A future failed with `std::invalid_argument`: `prefix`, the name of `expected`,
/// `routing_errors::butFound`, the name of `found`.
VELKOR_EXPORT Future<std::unique_ptr<Message>> failMismatch(const char* prefix,
                                                            const std::type_info& expected,
                                                            const std::type_info& found);

}  // namespace velkor::detail
