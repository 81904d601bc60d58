#pragma once

#include <cstdint>

#include "configuration/sources/ValueTable.hpp"
#include "layers/sqlite/detail/Write.hpp"

namespace velkor::layers::detail {

class WriteQueue;

/// Completes a write that is to be made in `values` next: what is there now, and what it weighs.
/// Throws `std::bad_alloc`.
void complete(const configuration::ValueTable& values, Write& write);

/// Makes a write in `values` and lets it wait in `queue`; gives its number. There is room for it.
/// Throws `std::bad_alloc`, and nothing has changed then.
std::int64_t put(configuration::ValueTable& values, WriteQueue& queue, PreparedWrite&& write);

/// Takes the last write of a key back. Throws `std::bad_alloc`, and nothing has changed then.
void putBack(configuration::ValueTable& values, const Write& write);

}  // namespace velkor::layers::detail
