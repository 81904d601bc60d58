#include "configuration/sources/DurableSource.hpp"

namespace velkor::configuration {

DurableSource::~DurableSource() = default;

}  // namespace velkor::configuration
