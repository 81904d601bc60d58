#pragma once

#include "framework/Number.hpp"

namespace velkor {

__attribute__((visibility("default"))) int product();

}  // namespace velkor
