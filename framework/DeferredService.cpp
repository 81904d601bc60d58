#include "framework/DeferredService.hpp"

namespace velkor {

DeferredService::~DeferredService() = default;

}  // namespace velkor
