#pragma once

namespace velkor {

__attribute__((visibility("default"))) int twice();

}  // namespace velkor
