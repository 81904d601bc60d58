#include "layers/sqlite/Loggers.hpp"

#include "layers/detail/Endings.hpp"

namespace velkor::layers {

const common::DiagnosticLogger sqliteLogger("velkor::layers::sqlite");

namespace {

// Made after the logger, so that it is destroyed before it: the threads that are waited for still
// write records.
[[maybe_unused]] const auto& endings = detail::Endings::ofLibrary();

}  // namespace

}  // namespace velkor::layers
