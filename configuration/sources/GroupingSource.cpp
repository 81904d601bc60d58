#include "configuration/sources/GroupingSource.hpp"

namespace velkor::configuration {

GroupingSource::~GroupingSource() = default;

}  // namespace velkor::configuration
