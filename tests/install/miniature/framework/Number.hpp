#pragma once

namespace velkor {

__attribute__((visibility("default"))) int number();

}  // namespace velkor
