#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::http::detail {

/// The diagnostic records of the server, on the channel "velkor::http".
extern const common::DiagnosticLogger logger;

}  // namespace velkor::http::detail
