#include "configuration/Configuration.hpp"

namespace velkor::configuration {

Configuration::~Configuration() = default;

}  // namespace velkor::configuration
