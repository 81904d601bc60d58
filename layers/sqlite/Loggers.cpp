#include "layers/sqlite/Loggers.hpp"

namespace velkor::layers {

const common::DiagnosticLogger sqliteLogger("velkor::layers::sqlite");

}  // namespace velkor::layers
