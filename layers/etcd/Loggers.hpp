#pragma once

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::layers {

/// The diagnostic records of values in etcd, on the channel "velkor::layers::etcd".
extern const common::DiagnosticLogger etcdLogger;

}  // namespace velkor::layers
