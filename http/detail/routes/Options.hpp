#pragma once

#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// GET /config: the effective options, a page of them, which is one reading of the store. Keys that
/// go while it is made are left out.
Response optionPage(const Context& context, const Call& call);

/// GET /config/KEY: all layers that hold the key, the effective one first.
Response optionLayers(const Context& context, const Call& call);

}  // namespace velkor::http::detail
