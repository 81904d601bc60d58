#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::configuration {

/// The diagnostic records of the store, on the channel "velkor::configuration".
extern const common::DiagnosticLogger storeLogger;

/// The diagnostic records of the property file parser, on the channel
/// "velkor::configuration::property_file".
extern const common::DiagnosticLogger propertyFileLogger;

}  // namespace velkor::configuration
