#include "framework/ServiceProvider.hpp"

namespace velkor {

Lifecycle::~Lifecycle() = default;

ServiceProvider::~ServiceProvider() = default;

}  // namespace velkor
