#pragma once

#include <functional>

#include "configuration/sources/SourceDescription.hpp"
#include "http/detail/routes/Route.hpp"

namespace velkor::http::detail {

/// GET /sources: the layers in their order, what they can do and how they stand, and whether the
/// client may write.
Response sourceList(const Context& context, const Call& call);

/// GET /settings: what the process has declared.
Response settingList(const Context& context, const Call& call);

/// GET /history: the newest changes of all layers that keep them, the newest first.
Response changeHistory(const Context& context, const Call& call);

/// Calls `visit` with each layer of the store, in their order. One that goes meanwhile is left out.
void forEachSource(const Context& context,
                   const std::function<void(const configuration::SourceDescription&,
                                            configuration::ConfigurationSource&)>& visit);

}  // namespace velkor::http::detail
