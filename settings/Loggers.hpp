#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::settings {

/// The diagnostic records of settings, on the channel "velkor::settings".
extern const common::DiagnosticLogger settingsLogger;

}  // namespace velkor::settings
