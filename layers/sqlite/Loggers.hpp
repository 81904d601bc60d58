#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::layers {

/// The diagnostic records of state files, on the channel "velkor::layers::sqlite".
extern const common::DiagnosticLogger sqliteLogger;

}  // namespace velkor::layers
