#include "configuration/sources/ForgettingSource.hpp"

namespace velkor::configuration {

ForgettingSource::~ForgettingSource() = default;

}  // namespace velkor::configuration
