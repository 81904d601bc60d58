#include "configuration/sources/ConfigurationSource.hpp"

namespace velkor::configuration {

ConfigurationSource::~ConfigurationSource() = default;

}  // namespace velkor::configuration
