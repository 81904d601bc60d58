#include "configuration/sources/JournaledSource.hpp"

namespace velkor::configuration {

JournaledSource::~JournaledSource() = default;

}  // namespace velkor::configuration
