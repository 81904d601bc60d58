#pragma once

#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// GET /healthz: the process is alive.
Response alive(const Context& context, const Call& call);

/// GET /readyz: whether all layers are well; to those who may read also which are not.
Response ready(const Context& context, const Call& call);

/// GET /metrics: what there is to count, as Prometheus reads it.
Response metricsText(const Context& context, const Call& call);

}  // namespace velkor::http::detail
