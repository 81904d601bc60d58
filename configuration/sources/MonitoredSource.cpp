#include "configuration/sources/MonitoredSource.hpp"

namespace velkor::configuration {

MonitoredSource::~MonitoredSource() = default;

}  // namespace velkor::configuration
