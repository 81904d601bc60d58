#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::layers {

/// The diagnostic records of files that are read again, on the channel "velkor::files".
extern const common::DiagnosticLogger filesLogger;

}  // namespace velkor::layers
