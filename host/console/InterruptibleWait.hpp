#pragma once

#include "framework/Future.hpp"

namespace velkor::host {

/// Waits for the result of `pending` and gives it, or throws what it failed with; throws
/// `Interrupted` when Ctrl-C was pressed before it came. The result is dropped then.
bool resultUnlessInterrupted(Future<bool>&& pending);

}  // namespace velkor::host
