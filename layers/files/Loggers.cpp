#include "layers/files/Loggers.hpp"

namespace velkor::layers {

const common::DiagnosticLogger filesLogger("velkor::files");

}  // namespace velkor::layers
