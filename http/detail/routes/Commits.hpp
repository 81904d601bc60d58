#pragma once

#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "http/detail/routes/PendingAnswer.hpp"
#include "http/detail/routes/WriteRecord.hpp"

namespace velkor::http::detail {

using Sources = std::vector<std::shared_ptr<configuration::ConfigurationSource>>;

/// The sources of `store` that are a `DurableSource`.
Sources durableSources(configuration::ConfigurationImpl& store);

/// Those of them that are called one of `names`.
Sources durableSources(configuration::ConfigurationImpl& store,
                       const std::vector<std::string>& names);

/// Gives `response` and writes `record` once all `sources`, durable ones, have committed what they
/// had accepted; waits for nothing. When one fails, the answer is an internal problem with the
/// reason. On the thread of a source, or at once on this one.
void answerOnceCommitted(const Sources& sources, WriteRecord record, PendingAnswer answer,
                         Response response);

}  // namespace velkor::http::detail
