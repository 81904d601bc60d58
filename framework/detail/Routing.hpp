#pragma once

#include <memory>
#include <typeinfo>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/common/Export.hpp"

namespace velkor::detail {

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
