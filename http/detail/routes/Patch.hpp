#pragma once

#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// PATCH /config: makes all changes of the body or none, or, with ?dry-run, tries to. Answered with
/// what was changed, once the layers that were written have committed it.
void patchOptions(const Context& context, Call& call);

}  // namespace velkor::http::detail
