#include "configuration/sources/AttachedSource.hpp"

namespace velkor::configuration {

SourceHost::~SourceHost() = default;

AttachedSource::~AttachedSource() = default;

}  // namespace velkor::configuration
